// The compile-time tables of the number text: powers of ten to 128 bits, and one scale per
// binary exponent for the fast pass. Only number_text.cpp includes this.
#pragma once

#include <array>
#include <bit>
#include <cstdint>

namespace numtext::detail {

__extension__ typedef unsigned __int128 u128;

// ---------------------------------------------------------------------------------------------
// Powers of ten for the number text.
//
// 10^k is held as a 128-bit mantissa t (2^127 <= t < 2^128) and a binary exponent b with
// t = floor(10^k / 2^b); the mantissa is exact for 0 <= k <= 55 (5^55 < 2^128) and a truncation
// (too small by less than one unit) elsewhere. The table is worked out by the compiler with a
// small big-integer type, so it costs nothing at run time.

inline constexpr int pow10_min = -330;  // 10^-300 scales the largest doubles down to 15 digits; the
                                        // smallest normal binades compare with 10^-323
inline constexpr int pow10_max = 340;   // 10^340 scales the smallest subnormals up to 15 digits
inline constexpr int exact_pow10_max = 55;

struct Pow10 {
    uint64_t hi;
    uint64_t lo;
    int32_t exp2;
};

// Little-endian 32-bit words, wide enough for 2^1024 and 5^340.
struct BigInt {
    std::array<uint32_t, 40> w{};

    constexpr int bit_length() const {
        for (int i = static_cast<int>(w.size()) - 1; i >= 0; --i)
            if (w[i] != 0)
                return i * 32 + (32 - std::countl_zero(w[i]));
        return 0;
    }
    constexpr void multiply_small(uint32_t m) {
        uint64_t carry = 0;
        for (uint32_t& word : w) {
            const uint64_t x = static_cast<uint64_t>(word) * m + carry;
            word = static_cast<uint32_t>(x);
            carry = x >> 32;
        }
    }
    constexpr void divide_small(uint32_t d) {
        uint64_t rem = 0;
        for (int i = static_cast<int>(w.size()) - 1; i >= 0; --i) {
            const uint64_t x = (rem << 32) | w[i];
            w[i] = static_cast<uint32_t>(x / d);
            rem = x % d;
        }
    }
    constexpr uint32_t bit(int i) const { return (w[i / 32] >> (i % 32)) & 1u; }
    // The 128 bits from bit position `from` upwards (bits below 0 read as zero).
    constexpr void top128(int from, uint64_t& hi, uint64_t& lo) const {
        hi = lo = 0;
        for (int i = 127; i >= 0; --i) {
            const int src = from + i;
            const uint64_t b = (src >= 0 && src < static_cast<int>(w.size()) * 32) ? bit(src) : 0;
            if (i >= 64)
                hi |= b << (i - 64);
            else
                lo |= b << i;
        }
    }
};

constexpr std::array<Pow10, pow10_max - pow10_min + 1> make_pow10_table() {
    std::array<Pow10, pow10_max - pow10_min + 1> table{};
    // 10^k = 5^k * 2^k for k >= 0.
    BigInt five_power;
    five_power.w[0] = 1;
    for (int k = 0; k <= pow10_max; ++k) {
        const int shift = five_power.bit_length() - 128;
        Pow10& p = table[k - pow10_min];
        five_power.top128(shift, p.hi, p.lo);
        p.exp2 = k + shift;
        five_power.multiply_small(5);
    }
    // 10^-j = 2^-j / 5^j, from floor(2^1020 / 5^j); flooring again by 5 keeps it exact.
    BigInt quotient;
    quotient.w[1020 / 32] = 1u << (1020 % 32);
    for (int j = 1; j <= -pow10_min; ++j) {
        quotient.divide_small(5);
        const int shift = quotient.bit_length() - 128;
        Pow10& p = table[-j - pow10_min];
        quotient.top128(shift, p.hi, p.lo);
        p.exp2 = shift - 1020 - j;
    }
    return table;
}

inline constexpr auto pow10_table = make_pow10_table();

// ---------------------------------------------------------------------------------------------
// The fast pass: one scale per binary exponent.
//
// A normal double a in the binade [2^q, 2^(q+1)) is M * 2^(q-63), M its significand normalised
// to 64 bits. Its 15-digit text has the decimal exponent e with 10^14 <= a * 10^(14-e) rounded
// to 15 digits < 10^15. The binade fixes e up to one step: e = floor(q * log10 2), plus one when
// the binade reaches the boundary (10^15 - 1/2) * 10^(e-14), at and above which a rounds to a
// 15-digit number of the next decade. Per binade the table holds e, the factors
// 10^(14-e) * 2^(q+14) and one tenth of it, floored to 64 bits, and the bits of the smallest
// double at or above the boundary (comparing the bits of positive doubles compares the
// doubles). The high half of M times the factor is then a * 10^(14-e) with 13 fraction bits, at
// the same place for every binade: no shift by a variable count, no division by ten, no carry
// into a 16th digit. The table is worked out by the compiler; a check that fails (a throw)
// stops the compilation.

inline constexpr int scale_fraction_bits = 13;

struct alignas(32) BinadeScale {
    uint64_t factor[2];  // [1]: for a at or above the threshold
    uint64_t threshold;  // bits of the smallest double at or above the boundary; or beyond
    int32_t exp10;       // e below the threshold
};

// floor(q * log10 2), exact over the double range.
constexpr int decimal_exponent_of_binade(int q) {
    return (q * 78913) >> 18;
}

// floor(10^k * 2^shift) for the fast factor: the table's mantissa moved to 64 bits. Both
// floors together are one floor, so the factor is short of the true value by less than one.
constexpr uint64_t scaled_power(int k, int shift) {
    const Pow10& t = pow10_table[k - pow10_min];
    const int right = -(t.exp2 + shift);  // 10^k * 2^shift = (hi:lo) >> right
    if (right < 64 || right > 127)
        throw "factor out of range";
    const u128 mantissa = (static_cast<u128>(t.hi) << 64) | t.lo;
    return static_cast<uint64_t>(mantissa >> right);
}

// The bits of the smallest double >= (10^16 - 5) * 10^j, the rounding boundary below 10^(j+16).
// Except for 999999999999999.5, that number is not a double (its odd part exceeds 2^53 or it is
// not a binary fraction), so this is its top 53 bits plus one. The table's 10^j may be short by
// less than one unit; the check makes sure that cannot reach the top 53 bits.
constexpr uint64_t boundary_bits(int j) {
    if (j == -1)
        return std::bit_cast<uint64_t>(999999999999999.5);
    constexpr uint64_t c = 10000000000000000ULL - 5;
    const Pow10& t = pow10_table[j - pow10_min];
    // c * (hi:lo) = upper * 2^64 + lower, upper < 2^119
    const u128 low_product = static_cast<u128>(c) * t.lo;
    const u128 upper = static_cast<u128>(c) * t.hi + static_cast<uint64_t>(low_product >> 64);
    const int upper_bits =
        128 - (static_cast<uint64_t>(upper >> 64) != 0 ? std::countl_zero(static_cast<uint64_t>(upper >> 64))
                                                       : 64 + std::countl_zero(static_cast<uint64_t>(upper)));
    const int drop = upper_bits - 53;  // bits of `upper` below the top 53
    uint64_t top = static_cast<uint64_t>(upper >> drop);
    const u128 below = upper & ((static_cast<u128>(1) << drop) - 1);
    if (below + 1 == (static_cast<u128>(1) << drop))
        throw "boundary too close to call";
    int exp2 = t.exp2 + 64 + drop + 52;
    ++top;
    if (top == uint64_t{1} << 53) {
        top >>= 1;
        ++exp2;
    }
    return (static_cast<uint64_t>(exp2 + 1023) << 52) | (top & ((uint64_t{1} << 52) - 1));
}

// The exponent that marks zero, subnormals, infinities and NaN (biased exponents 0 and 2047):
// their factor of zero makes the fast pass decide at once, and the text goes to format_rare.
inline constexpr int rare_exponent = 1000;

constexpr std::array<BinadeScale, 2048> make_binade_scales() {
    std::array<BinadeScale, 2048> table{};
    for (int biased : {0, 2047})
        table[biased] = {{0, 0}, ~uint64_t{0}, rare_exponent};
    for (int biased = 1; biased <= 2046; ++biased) {
        const int q = biased - 1023;
        const int e = decimal_exponent_of_binade(q);
        BinadeScale& s = table[biased];
        s.factor[0] = scaled_power(14 - e, q + 1 + scale_fraction_bits);
        s.factor[1] = scaled_power(13 - e, q + 1 + scale_fraction_bits);
        s.exp10 = e;
        const uint64_t threshold = boundary_bits(e - 15);
        const int threshold_biased = static_cast<int>(threshold >> 52);
        if (threshold_biased < biased)
            throw "boundary below the binade";
        s.threshold = threshold_biased == biased ? threshold : ~uint64_t{0};
    }
    return table;
}

inline constexpr auto binade_scales = make_binade_scales();

}  // namespace numtext::detail
