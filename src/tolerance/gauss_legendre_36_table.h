// The 36-point Gauss-Legendre rule of the normal two-sided K-factor, as the 18 symmetric pairs
// (negative node, weight) that findGaussianQuadratureWeights(36) returns, stored bit for bit in
// hexadecimal so that the K-factor need not rebuild the rule (an eigen-system solve that costs
// more than the rest of the K-factor) on every call. The values are that routine's output, not
// the correctly rounded exact rule: test_normal_model checks the two are identical bit for bit,
// so a change in the routine shows up there. Included only by normal_model.cpp.
#ifndef KELSTAT_TOLERANCE_GAUSS_LEGENDRE_36_TABLE_H
#define KELSTAT_TOLERANCE_GAUSS_LEGENDRE_36_TABLE_H

namespace kelstat {

struct GaussLegendrePair {
    double node;
    double weight;
};

// clang-format off
inline constexpr GaussLegendrePair kNormalKFactorRule[] = {
    {-0x1.fee3a266a4b66p-1, 0x1.6cc147efc77f4p-8},  // 0: -0.99783046248408591 0.0055657196642453395
    {-0x1.fa2801c84e3b5p-1, 0x1.a73ad197493dap-7},  // 1: -0.98858647890221241 0.012915947284065799
    {-0x1.f1ad9d0fbaccep-1, 0x1.4aa7690bfff23p-6},  // 2: -0.97202769104969788 0.020181515297735275
    {-0x1.e584095f5a375p-1, 0x1.bf42b7a3fba8p-6},  // 3: -0.94827298439950758 0.027298621498568654
    {-0x1.d5c244af6523ap-1, 0x1.18478fca8f612p-5},  // 4: -0.91749777451565895 0.034213810770307287
    {-0x1.c28628ab33396p-1, 0x1.4edaa9ad53efcp-5},  // 5: -0.87992980089039707 0.040875750923644788
    {-0x1.abf428ed5fb59p-1, 0x1.82f3265a10918p-5},  // 6: -0.8358471669924753 0.047235083490266117
    {-0x1.92370c31dd978p-1, 0x1.b42e422704ef3p-5},  // 7: -0.78557623013220645 0.053244713977759782
    {-0x1.757f9acd8f982p-1, 0x1.e22eab5249d57p-5},  // 8: -0.72948917159355653 0.058860144245324868
    {-0x1.56044211a50dep-1, 0x1.064e983484229p-4},  // 9: -0.66800123658552102 0.064039797355015651
    {-0x1.3400ad140cf9fp-1, 0x1.1994b25a09e67p-4},  // 10: -0.60156765813598045 0.06874532383573638
    {-0x1.0fb553915ecc3p-1, 0x1.2ac51c29b9d71p-4},  // 11: -0.53068028592624505 0.072941885005652699
    {-0x1.d2cdff731183ap-2, 0x1.39bf414a64bbcp-4},  // 12: -0.45586394443342082 0.076598410645870751
    {-0x1.82bc9799e7823p-2, 0x1.4666beb110c17p-4},  // 13: -0.37767254711968884 0.079687828912071587
    {-0x1.2fce3100ddb5cp-2, 0x1.50a3986a48c7bp-4},  // 14: -0.29668499534402826 0.082187266704339665
    {-0x1.b53ff4b157911p-3, 0x1.5862670d2d5a9p-4},  // 15: -0.213500892316866 0.084078218979661515
    {-0x1.07a6cb5d67f9fp-3, 0x1.5d947c8128c62p-4},  // 16: -0.12873610380938502 0.085346685739339928
    {-0x1.6067b3727a33bp-5, 0x1.602fffd01de07p-4},  // 17: -0.043018198473708989 0.085983275670393863
};
// clang-format on
static_assert(sizeof(kNormalKFactorRule) / sizeof(kNormalKFactorRule[0]) == 18);

}  // namespace kelstat

#endif  // KELSTAT_TOLERANCE_GAUSS_LEGENDRE_36_TABLE_H
