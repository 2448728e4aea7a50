// The oracle the accuracy tests compare against: Boost.Math at 50 digits, under a policy that
// returns NaN or the saturated value instead of throwing.
#ifndef KELSTAT_TESTS_SUPPORT_WIDE_ORACLE_H
#define KELSTAT_TESTS_SUPPORT_WIDE_ORACLE_H

#include <boost/math/policies/policy.hpp>
#include <boost/multiprecision/cpp_bin_float.hpp>

namespace kelstat_test {

using Wide = boost::multiprecision::cpp_bin_float_50;

using QuietPolicy = boost::math::policies::policy<
    boost::math::policies::domain_error<boost::math::policies::ignore_error>,
    boost::math::policies::pole_error<boost::math::policies::ignore_error>,
    boost::math::policies::overflow_error<boost::math::policies::ignore_error>,
    boost::math::policies::underflow_error<boost::math::policies::ignore_error>,
    boost::math::policies::evaluation_error<boost::math::policies::ignore_error>>;

}  // namespace kelstat_test

#endif
