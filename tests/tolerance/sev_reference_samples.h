// Residual samples of the smallest-extreme-value K-factor references, shared by the test and by
// the programs in tests/gen that wrote tests/data/sev_kfactor_reference.csv. Each sample is a
// list of standardized residuals (location 0, scale 1), so the equation sees exactly these
// doubles.
#ifndef KELSTAT_TESTS_TOLERANCE_SEV_REFERENCE_SAMPLES_H
#define KELSTAT_TESTS_TOLERANCE_SEV_REFERENCE_SAMPLES_H

#include <cmath>
#include <cstdlib>
#include <string>
#include <vector>

namespace kelstat::testing {

// The ten observations of the model's worked example.
inline std::vector<double> sevWorkedExample() {
    return {0.5347, -2.2396, -1.6978, 0.107, -0.6328, -0.4885, -1.1826, -1.839, 0.7175, 1.1728};
}

// Standard smallest-extreme-value quantiles at the plotting positions (i - 1/2) / n, stretched by
// spread and moved by shift: a sample of any size that looks like fitted residuals.
inline std::vector<double> sevPlottingSample(unsigned n, double spread, double shift) {
    std::vector<double> sample(n);
    for (unsigned i = 0; i < n; ++i) {
        const double position = (i + 0.5) / n;
        sample[i] = spread * std::log(-std::log1p(-position)) + shift;
    }
    return sample;
}

// Samples by name: "example", "pair", "triple", or "pp<n>" (plotting positions, unit spread,
// no shift) and "wide<n>" (spread 1.3, shift -0.2). Empty for an unknown name.
inline std::vector<double> sevReferenceSample(const std::string& name) {
    if (name == "example") return sevWorkedExample();
    if (name == "pair") return {-0.3, 0.6};
    if (name == "triple") return {-1.2, 0.1, 0.7};
    if (name.rfind("pp", 0) == 0) {
        return sevPlottingSample(static_cast<unsigned>(std::atol(name.c_str() + 2)), 1.0, 0.0);
    }
    if (name.rfind("wide", 0) == 0) {
        return sevPlottingSample(static_cast<unsigned>(std::atol(name.c_str() + 4)), 1.3, -0.2);
    }
    return {};
}

}  // namespace kelstat::testing

#endif  // KELSTAT_TESTS_TOLERANCE_SEV_REFERENCE_SAMPLES_H
