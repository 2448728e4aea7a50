// Test helper: a ZRXRealFunction around a lambda that records every argument it is called with.
#ifndef KELSTAT_TESTS_NUMERICS_COUNTED_FUNCTION_H
#define KELSTAT_TESTS_NUMERICS_COUNTED_FUNCTION_H

#include <utility>
#include <vector>

#include "numerics/real_function.h"

namespace kelstat {
namespace testing {

template <class Body>
class CountedFunction : public ZRXRealFunction {
  public:
    explicit CountedFunction(Body body, bool integerX = false) : mBody(std::move(body)) {
        mIntegerX = integerX;
    }
    double operator()(double x) override {
        arguments.push_back(x);
        return mBody(x);
    }
    int calls() const { return static_cast<int>(arguments.size()); }

    std::vector<double> arguments;

  private:
    Body mBody;
};

template <class Body>
CountedFunction<Body> counted(Body body) {
    return CountedFunction<Body>(std::move(body));
}

template <class Body>
CountedFunction<Body> countedInteger(Body body) {
    return CountedFunction<Body>(std::move(body), true);
}

}  // namespace testing
}  // namespace kelstat

#endif  // KELSTAT_TESTS_NUMERICS_COUNTED_FUNCTION_H
