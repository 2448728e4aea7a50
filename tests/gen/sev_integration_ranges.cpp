// First half of the smallest-extreme-value K-factor references: for every case, the integration
// range the library uses (exact doubles in hexadecimal) and its K-factor as a starting hint for
// the high-precision solve of tests/gen/sev_kfactor_reference.cpp, which reads these lines.
//
// Build and run from the repository root after building kelstat_core in build/extremevalue:
//   g++ -std=c++17 -O2 -ffp-contract=off -Isrc -Iinclude -Iplatform/qdr -Itests/tolerance \
//     tests/gen/sev_integration_ranges.cpp build/extremevalue/src/libkelstat_core.a \
//     build/extremevalue/platform/qdr/libkelstat_qdr.a -o /tmp/sev_ranges
//   /tmp/sev_ranges > /tmp/sev_ranges.txt
#include <cstdio>
#include <string>
#include <vector>

#include "sev_reference_samples.h"
#include "tolerance/extreme_value_models.h"

namespace {

struct Request {
    double alpha;
    double proportion;
    int sign;
};

void writeCases(const std::string& name, const std::vector<Request>& requests) {
    const std::vector<double> sample = kelstat::testing::sevReferenceSample(name);
    const kelstat::SevIntegrationRange range = kelstat::sevIntegrationRange(sample);
    kelstat::SExtremeValueModelTI model(sample.data(), static_cast<uint32_t>(sample.size()), 0.05,
                                        0.95, kel_TwoSided);
    model.location = 0.0;
    model.scale = 1.0;
    for (const Request& request : requests) {
        double k = 0.0;
        model.calcLowerKFactor(request.alpha, request.proportion, k, request.sign);
        std::printf("%s,%zu,%.17g,%.17g,%d,%a,%a,%d,%.17g\n", name.c_str(), sample.size(),
                    request.alpha, request.proportion, request.sign, range.lower, range.upper,
                    range.logarithmic ? 1 : 0, k);
    }
}

}  // namespace

int main() {
    const std::vector<Request> full = {{0.05, 0.9, -1},  {0.95, 0.1, 1},   {0.025, 0.95, -1},
                                       {0.975, 0.05, 1}, {0.01, 0.99, -1}, {0.99, 0.01, 1},
                                       {0.1, 0.75, -1},  {0.9, 0.25, 1}};
    const std::vector<Request> pairOnly = {{0.05, 0.9, -1}, {0.95, 0.1, 1}};
    for (const char* name : {"example", "pair", "triple", "pp5", "pp20", "wide50"}) {
        writeCases(name, full);
    }
    for (const char* name : {"pp1000", "wide2000", "pp10000", "pp100000", "pp1000000"}) {
        writeCases(name, pairOnly);
    }
}
