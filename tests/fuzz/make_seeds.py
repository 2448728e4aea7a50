#!/usr/bin/env python3
"""Writes the hand-made seeds of the fuzz corpus (corpus/<target>/seed_*), in the byte format that
fuzz_input.h reads. Inputs the fuzzers found are kept next to them under their own names.
Run from anywhere: python3 tests/fuzz/make_seeds.py"""
import math
import os
import struct

HERE = os.path.dirname(os.path.abspath(__file__))

# Tags of FuzzInput::value().
SPECIAL = {'nan': 0, 'inf': 1, '-inf': 2, '+0': 3, '-0': 4, 'denorm': 5, '-denorm': 6,
           'min': 7, 'max': 8, '-max': 9, 'limit': 10, '-limit': 11, 'below-limit': 12,
           'int32-max': 13, 'eps': 14}


def u16(v):
    return struct.pack('<H', v & 0xFFFF)


def u32(v):
    return struct.pack('<I', v & 0xFFFFFFFF)


def value(x):
    """A data value: a special by name, a short decimal through the digits tags, else raw."""
    if isinstance(x, str):
        return bytes([SPECIAL[x]])
    if x == 0 and math.copysign(1, x) > 0:
        return bytes([SPECIAL['+0']])
    for exponent in range(-8, 8):
        digits = x / 10.0 ** exponent
        if abs(digits) <= 32767 and digits == round(digits) and round(digits) * 10.0 ** exponent == x:
            tag = 16 + (exponent + 8)
            return bytes([tag]) + struct.pack('<h', int(round(digits)))
    return bytes([15]) + struct.pack('<d', x)


# Tags of FuzzInput::level().
LEVEL = {0.0: 0, 1.0: 1, -0.5: 2, 'nan': 3, 'inf': 4, '-inf': 5, 1.5: 6, 'denorm': 7,
         'below-one': 8, 0.5: 10, 0.999999: 11, 1e-9: 12, '-0': 13, 0.9: 14, 0.99: 15, 0.95: 20}


def level(x):
    if x in LEVEL:
        return bytes([LEVEL[x]])
    return bytes([9]) + struct.pack('<d', x)


def column(values):
    """fillColumn in its first mode: every value given."""
    return bytes([0]) + b''.join(value(x) for x in values)


def generated(location, scale, shape, seed, planted=None):
    """fillColumn generating: shape 1 uniform, 2 exponential, 3 heavy-tailed; planted = (index,
    value) puts one value in place."""
    mode = shape | (4 if planted else 0)
    out = bytes([mode]) + value(location) + value(scale) + u32(seed)
    if planted:
        out += u16(planted[0]) + value(planted[1])
    return out


def write(target, name, data):
    folder = os.path.join(HERE, 'corpus', target)
    os.makedirs(folder, exist_ok=True)
    with open(os.path.join(folder, 'seed_' + name), 'wb') as f:
        f.write(data)


# Stem-and-leaf: flags bit 0 sort, bit 1 change the scale before the run, bits 2-4 all set a null
# column, bit 5 an increment follows, bit 6 trimOutliers follows.
def stemleaf(name, values=None, gen=None, count=None, sort=True, increment=None, trim=None,
             tamper=None, null_count=None):
    flags = (1 if sort else 0) | (2 if tamper else 0) | (0x1C if null_count is not None else 0)
    flags |= (0x20 if increment is not None else 0) | (0x40 if trim is not None else 0)
    out = bytes([flags])
    if increment is not None:
        out += value(increment)
    if trim is not None:
        out += bytes([trim])
    if values is not None:
        out += u16(len(values)) + column(values)
    else:
        out += u16(count) + gen
    if null_count is not None:
        out += bytes([null_count])
    if tamper:
        field, new = tamper
        out += bytes([field]) + (bytes([new]) if field == 3 else value(new))
    write('stemleaf', name, out)


stemleaf('classic', [12, 15, 21, 23, 23, 27, 31, 38, 44, 45, 45, 52, 60, 61, 75])
stemleaf('unsorted', [5, 3, 9, 1], sort=False)
stemleaf('nan_inside', [1, 2, 'nan', 4])
stemleaf('nan_unsorted', ['nan', 1, 2], sort=False)
stemleaf('infinities', ['-inf', -1, 0, 1, 'inf'])
stemleaf('inf_only', ['inf', 'inf'])
stemleaf('signed_zeros', ['-0', '+0', '-0', '+0'])
stemleaf('zero_line', [-0.3, -0.1, '-0', '+0', 0.2, 0.4, 1.5])
stemleaf('subnormals', ['-denorm', 'denorm', 'min'])
stemleaf('at_limit', [1, 'limit'])
stemleaf('below_limit', ['-limit', 'below-limit'])
stemleaf('int32_max', ['int32-max'])
stemleaf('max_double', ['-max', 'max'])
stemleaf('single', [42])
stemleaf('all_equal', [7, 7, 7, 7, 7])
stemleaf('tenths', [1.1, 1.2, 1.2, 1.3, 2.4, 3.6])
stemleaf('uniform_5000', gen=generated(0, 1000, 1, 7), count=5000)
stemleaf('heavy_tail_trimmed', gen=generated(-50, 3, 3, 11), count=3000, trim=1)
stemleaf('trim_three', [1, 2, 1000], trim=1)
stemleaf('trim_with_inf', ['-inf', 1, 2, 3, 4, 'inf'], trim=1)
stemleaf('increment_small', gen=generated(0, 1e6, 1, 3), count=200, increment=1e-6)
stemleaf('increment_nan', [1, 2, 3, 40], increment='nan')
stemleaf('increment_huge', [1, 2, 3, 40], increment='max')
stemleaf('increment_inf', [1, 2, 3], increment='inf')
stemleaf('increment_denorm', ['-max', 'max'], increment='denorm')
stemleaf('leaf_unit_zero', [1, 2, 3], tamper=(0, 0.0))
stemleaf('leaf_unit_negative', [1, 2, 3], tamper=(0, -1.0))
stemleaf('leaf_unit_nan', [1, 2, 3], tamper=(0, 'nan'))
stemleaf('leaf_unit_inf', [1, 2, 3], tamper=(0, 'inf'))
stemleaf('too_many_lines', [-30000, 30000], tamper=(0, 'denorm'))
stemleaf('leaf_unit_tiny', [-1000, 1000], tamper=(0, 1e-7))
stemleaf('per_line_three', [1, 2, 3], tamper=(1, 3))
stemleaf('trim_flag_after_scale', gen=generated(0, 1, 3, 5), count=100, tamper=(3, 1))
stemleaf('increment_after_scale', [1, 2, 3, 50], tamper=(2, 0.5))
stemleaf('null_column', [], null_count=5)
stemleaf('empty', [])
stemleaf('planted_nan', gen=generated(0, 10, 1, 9, planted=(50, 'nan')), count=100)
stemleaf('planted_inf', gen=generated(0, 10, 1, 9, planted=(99, 'inf')), count=100)


# Tolerance intervals: flags bit 7 a 32-bit distribution code, bit 6 a 16-bit count; then the
# confidence type tag, the two levels, the column; a null column with its own count.
def tolerance(target, name, distribution=0, ctype=0, confidence=0.95, proportion=0.9,
              values=None, gen=None, count=None, null_count=None, sort=True):
    if null_count is not None:
        values = []
    wide_count = values is None or len(values) >= 40
    flags = 0x40 if wide_count else 0
    if target == 'parametric':
        flags |= 0x80 if distribution > 9 else 0
        flags |= 0x0F if null_count is not None else 0
    else:
        flags |= 1 if sort else 0
        flags |= 0x0E if null_count is not None else 0
    out = bytes([flags])
    if target == 'parametric':
        out += u32(distribution) if distribution > 9 else bytes([distribution])
    out += bytes([ctype + 1]) if ctype in (-1, 0, 1) else bytes([250]) + u32(ctype)
    out += level(confidence) + level(proportion)
    n = len(values) if values is not None else count
    out += u16(n) if wide_count else bytes([n])
    out += column(values) if values is not None else gen
    if null_count is not None:
        out += u16(null_count)
    write(target, name, out)


normal_sample = [9.8, 10.2, 10.1, 9.7, 10.4, 9.9, 10.0, 10.3, 9.6, 10.5]
positive_sample = [0.5, 1.2, 2.3, 0.8, 3.1, 1.7, 0.9, 2.8, 1.1, 4.2, 0.6, 1.9]
for code in range(10):
    for ctype in (-1, 0, 1):
        data = positive_sample if code else normal_sample
        tolerance('parametric', 'code%d_type%d' % (code, ctype), code, ctype, values=data)
tolerance('parametric', 'code_all_ones', 0xFFFFFFFF, 0, values=normal_sample)
tolerance('parametric', 'type_outside', 2, 7, values=positive_sample)
tolerance('parametric', 'type_most_negative', 0, -2**31, values=normal_sample)
for name, conf, prop in [('conf0', 0.0, 0.9), ('conf1', 1.0, 0.9), ('conf_nan', 'nan', 0.9),
                         ('conf_negative', -0.5, 0.9), ('conf_inf', 'inf', 0.9),
                         ('prop0', 0.95, 0.0), ('prop1', 0.95, 1.0), ('prop_nan', 0.95, 'nan'),
                         ('prop_above_one', 0.95, 1.5), ('prop_below_one', 0.95, 'below-one'),
                         ('conf_denorm', 'denorm', 0.9), ('prop_tiny', 0.95, 1e-9)]:
    for code, ctype in ((0, 0), (3, -1), (6, 0), (8, 1)):
        tolerance('parametric', '%s_code%d' % (name, code), code, ctype, conf, prop,
                  values=positive_sample)
for code in range(9):
    tolerance('parametric', 'n1_code%d' % code, code, 1, values=[3.5])
    tolerance('parametric', 'equal_code%d' % code, code, 0, values=[2, 2, 2, 2])
    tolerance('parametric', 'negative_code%d' % code, code, 0, values=[-3, -1, 2, 5, 8])
    tolerance('parametric', 'nan_code%d' % code, code, 0, values=[1, 2, 'nan', 4])
    if code in (1, 2, 3, 7):
        tolerance('parametric', 'zero_code%d' % code, code, -1, values=['+0', 1, 2, 3])
    tolerance('parametric', 'n4000_code%d' % code, code, 0, 0.99, 0.99,
              gen=generated(10, 2, 2, 100 + code), count=4000)
tolerance('parametric', 'n0', 0, 0, values=[])
tolerance('parametric', 'null_data', 2, 0, null_count=1000)
tolerance('parametric', 'infinity', 0, 0, values=[1, 2, 'inf', 4])
tolerance('parametric', 'huge', 5, 0, values=['max', 'max', '-max'])
tolerance('parametric', 'heavy_tail_logistic', 8, 0, gen=generated(0, 1, 3, 77), count=500)
tolerance('parametric', 'exponential_n2_high', 6, 0, 0.99, 0.99, values=[1.0, 2.0])
tolerance('parametric', 'exponential_n3_high', 6, 0, 0.99, 0.99, values=[1.0, 2.0, 4.0])
tolerance('parametric', 'subnormal_spread', 0, 0, values=['denorm', '-denorm', '+0'])

for ctype in (-1, 0, 1):
    tolerance('nonparametric', 'type%d' % ctype, ctype=ctype,
              gen=generated(0, 1, 1, 5), count=100)
tolerance('nonparametric', 'type_outside', ctype=5, gen=generated(0, 1, 1, 5), count=100)
tolerance('nonparametric', 'small_sample', values=[1, 2, 3, 4, 5])
tolerance('nonparametric', 'n0', values=[])
tolerance('nonparametric', 'n1', values=[2.5])
tolerance('nonparametric', 'n2', values=[2.5, 3.5])
tolerance('nonparametric', 'unsorted', values=[5, 1, 4, 2, 3, 9, 0], sort=False)
tolerance('nonparametric', 'with_nan', values=[1, 2, 'nan', 4, 5, 6], sort=False)
tolerance('nonparametric', 'with_infinities', values=['-inf', 1, 2, 3, 'inf'])
tolerance('nonparametric', 'null_data', null_count=60000)
tolerance('nonparametric', 'n4000', confidence=0.999, proportion=0.999,
          gen=generated(0, 1, 3, 8), count=4000)
for name, conf, prop in [('conf0', 0.0, 0.9), ('conf1', 1.0, 0.9), ('conf_nan', 'nan', 0.9),
                         ('conf_negative', -0.5, 0.9), ('conf_inf', 'inf', 0.9),
                         ('conf_minus_inf', 0.95, '-inf'),
                         ('prop0', 0.95, 0.0), ('prop1', 0.95, 1.0), ('prop_nan', 0.95, 'nan'),
                         ('prop_above_one', 0.95, 1.5), ('prop_below_one', 0.95, 'below-one'),
                         ('conf_denorm', 'denorm', 0.9), ('prop_tiny', 0.95, 1e-9),
                         ('conf_half', 0.5, 0.5), ('conf_negzero', '-0', 0.9)]:
    for ctype in (-1, 0):
        tolerance('nonparametric', '%s_type%d' % (name, ctype), ctype=ctype, confidence=conf,
                  proportion=prop, gen=generated(0, 1, 1, 3), count=50)
