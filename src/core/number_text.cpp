#include "core/number_text.h"
#include "core/number_text_tables.h"

#include <array>
#include <bit>
#include <cfloat>
#include <charconv>
#include <cmath>
#include <cstdio>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

static_assert(std::endian::native == std::endian::little,
              "the digit text is built in little-endian registers");

namespace numtext {

namespace {

using namespace detail;

constexpr char digit_pairs[201] =
    "00010203040506070809101112131415161718192021222324252627282930313233343536373839"
    "40414243444546474849505152535455565758596061626364656667686970717273747576777879"
    "8081828384858687888990919293949596979899";

constexpr uint64_t ten14 = 100000000000000ULL;
constexpr uint64_t ten15 = 1000000000000000ULL;

// A positive number rounded to 15 significant digits: value = digits * 10^(exp10 - 14),
// 10^14 <= digits < 10^15.
struct Decimal15 {
    uint64_t digits;
    int exp10;
};

// The exact path for the few values the fast path cannot decide (a 15-digit rounding that
// lies within the table's error of a half): the C library's correctly rounded conversion.
Decimal15 round15_exact(double a) {
    char buf[64];
    std::snprintf(buf, sizeof buf, "%.14e", a);
    Decimal15 d{0, 0};
    const char* s = buf;
    // The point may be a locale's character: take the digits, skip everything else.
    for (; *s != '\0' && *s != 'e'; ++s)
        if (*s >= '0' && *s <= '9')
            d.digits = d.digits * 10 + static_cast<uint64_t>(*s - '0');
    if (*s == 'e') {
        ++s;
        const bool negative = *s == '-';
        if (*s == '-' || *s == '+')
            ++s;
        for (; *s >= '0' && *s <= '9'; ++s)
            d.exp10 = d.exp10 * 10 + (*s - '0');
        if (negative)
            d.exp10 = -d.exp10;
    }
    return d;
}

// Compares the 192-bit number top:middle:low with half:0:0.
inline int compare192(uint64_t top, uint64_t middle, uint64_t low, uint64_t half) {
    if (top != half)
        return top > half ? 1 : -1;
    return (middle | low) != 0 ? 1 : 0;
}

// Correctly rounds a positive finite double to 15 significant digits (an exact half to even).
//
// With a = M * 2^p (M normalised to 64 bits) and e = floor(log10 2^(p+63)), a * 10^(14-e) lies in
// [10^14, 2 * 10^15). The product of M and the 128-bit power of ten is that value in fixed point
// with at least 140 fraction bits (12 to 18 of them in the top word), too small by less than M
// units of its last bit, or exact when the power is. Dividing by 10 when the integer part has 16
// digits and comparing the rest with a half decides the rounding. The first pass multiplies by
// the power's high word only, which is short by less than one unit of the top word: that
// decides all but about one value in 2^11, those within a unit of the half. They take the full
// 192-bit product, and the few that even that cannot decide take the exact path.
template <bool full_product>
Decimal15 round15(double a) {
    const uint64_t bits = std::bit_cast<uint64_t>(a);
    const uint64_t m = bits & ((uint64_t{1} << 52) - 1);
    const int biased = static_cast<int>(bits >> 52);
    uint64_t M;
    int p;
    if (biased != 0) [[likely]] {
        M = (m | (uint64_t{1} << 52)) << 11;
        p = biased - 1075 - 11;
    } else {
        const int norm = std::countl_zero(m);
        M = m << norm;
        p = -1074 - norm;
    }
    int e = ((p + 63) * 78913) >> 18;  // floor((p + 63) * log10 2), exact over the double range
    const int k = 14 - e;
    const Pow10& t = pow10_table[k - pow10_min];

    u128 product = static_cast<u128>(M) * t.hi;
    uint64_t low = 0;
    if constexpr (full_product) {
        const u128 low_product = static_cast<u128>(M) * t.lo;
        product += static_cast<uint64_t>(low_product >> 64);
        low = static_cast<uint64_t>(low_product);
    }
    const uint64_t top = static_cast<uint64_t>(product >> 64);
    const uint64_t middle = static_cast<uint64_t>(product);
    const int g = -(p + t.exp2) - 128;  // fraction bits within `top`

    const uint64_t whole = top >> g;
    const bool sixteen = whole >= ten15;
    const uint64_t divisor = sixteen ? 10 : 1;
    uint64_t n = sixteen ? whole / 10 : whole;
    const uint64_t rest = ((whole - n * divisor) << g) | (top & ((uint64_t{1} << g) - 1));
    const uint64_t half = divisor << (g - 1);
    e += sixteen;

    // Away from the half the top word decides, without a branch: for measured data the
    // direction is a coin toss.
    bool up = rest > half;
    if (rest - (half - 1) <= 1) [[unlikely]] {
        if constexpr (!full_product) {
            return round15<true>(a);
        } else {
            const int vs_half = compare192(rest, middle, low, half);
            if (k >= 0 && k <= exact_pow10_max) {
                up = vs_half > 0 || (vs_half == 0 && (n & 1) != 0);
            } else if (vs_half >= 0) {
                up = true;  // the true product is above the computed one
            } else {
                // The true product is below the computed one plus M: round down if that stays
                // below the half, otherwise it is too close to call here.
                const uint64_t low2 = low + M;
                const uint64_t carry1 = low2 < low;
                const uint64_t middle2 = middle + carry1;
                const uint64_t carry2 = carry1 != 0 && middle2 == 0;
                if (compare192(rest + carry2, middle2, low2, half) > 0)
                    return round15_exact(a);
                up = false;
            }
        }
    }
    n += up;
    if (n == ten15) {
        n = ten14;
        ++e;
    }
    return {n, e};
}

// Correctly rounds a positive double, given as its bits, to 15 significant digits; for a rare
// number (zero, subnormal, infinity, NaN) the exponent comes out as rare_exponent.
// The product falls short of a * 10^(14-e) * 2^13 by less than two units: away from a
// remainder of one half (4096) by two units, the product decides; the rest, about one value in
// 4096, take the 128-bit pass. A value just below a power of ten may come out one unit short of
// 10^14 with a remainder near one: it rounds up to 10^14.
inline Decimal15 round15_fast(uint64_t bits) {
    const BinadeScale& s = binade_scales[bits >> 52];
    const bool above = bits >= s.threshold;
    const uint64_t m = (bits << 11) | (uint64_t{1} << 63);
    const uint64_t top = static_cast<uint64_t>((static_cast<u128>(m) * s.factor[above]) >> 64);
    constexpr uint64_t half = uint64_t{1} << (scale_fraction_bits - 1);
    constexpr uint64_t fraction_mask = (uint64_t{1} << scale_fraction_bits) - 1;
    if (((top + 1) & (fraction_mask - 1)) == half) [[unlikely]]  // a remainder of half - 1 or half
        return round15<true>(std::bit_cast<double>(bits));
    return {(top + (half - 1)) >> scale_fraction_bits, s.exp10 + above};
}

// Writes the exponent part, E-05, E+20 or E+308, and returns its length.
inline int exponent_to(char* out, int e) {
    out[0] = 'E';
    out[1] = e < 0 ? '-' : '+';
    int x = e < 0 ? -e : e;
    int length = 4;
    if (x >= 100) {
        out[2] = static_cast<char>('0' + x / 100);
        x %= 100;
        ++out;
        length = 5;
    }
    std::memcpy(out + 2, digit_pairs + 2 * x, 2);
    return length;
}

int format_rare(char* out, double value);

#if defined(__SSE2__)

// The text is built in a vector register and stored whole: 16 characters, the sign first and
// the 15 digits after it. Storing characters piecemeal and copying them on would make the
// processor wait for its store buffer.

// A constant the compiler must keep as it is: it would otherwise turn some multiplications by
// constants into several shifts and additions, more work than the one multiplication.
inline __m128i opaque(__m128i v) {
    __asm__("" : "+x"(v));
    return v;
}

// The 15 digits of 10^14 <= n < 10^15 as byte values 0..9 in bytes 1..15, byte 0 zero: two
// 8-digit halves, each split in two by 10^4 (32-bit lanes), then by 100 (16-bit lanes), then by
// 10 (bytes), all halves at once. The divisions are multiplications by reciprocals that are
// exact over these ranges; each remainder comes with its quotient from one more multiplication:
// y * 2^16 + q * (1 - 100 * 2^16) = q + (y - 100 q) * 2^16, likewise for 10 and 2^8.
inline __m128i digit_values(uint64_t n) {
    const uint64_t high = n / 100000000;  // 7 digits, so byte 0 comes out zero
    const uint64_t low = n - high * 100000000;
    const __m128i halves = _mm_set_epi64x(static_cast<long long>(low), static_cast<long long>(high));
    const __m128i by_10000 = _mm_srli_epi64(_mm_mul_epu32(halves, _mm_set1_epi64x(0xD1B71759)), 45);
    const __m128i mod_10000 = _mm_sub_epi32(halves, _mm_mul_epu32(by_10000, _mm_set1_epi64x(10000)));
    const __m128i quarters = _mm_or_si128(by_10000, _mm_slli_epi64(mod_10000, 32));
    // Each quarter y < 10^4 in both 16-bit halves of its lane, for the quotient in both.
    const __m128i high_half = _mm_slli_epi32(quarters, 16);
    const __m128i by_100 =
        _mm_srli_epi16(_mm_mulhi_epu16(_mm_or_si128(quarters, high_half), _mm_set1_epi16(5243)), 3);
    const __m128i pairs =
        _mm_add_epi16(_mm_mullo_epi16(by_100, opaque(_mm_set1_epi32(0xFF9C0001))), high_half);
    const __m128i tens = _mm_mulhi_epu16(pairs, _mm_set1_epi16(6554));
    return _mm_add_epi16(_mm_mullo_epi16(tens, opaque(_mm_set1_epi16(static_cast<short>(0xF601)))),
                         _mm_slli_epi16(pairs, 8));
}

struct alignas(16) Bytes16 {
    uint64_t w[2];
};

inline __m128i load(const Bytes16& b) {
    return _mm_load_si128(reinterpret_cast<const __m128i*>(b.w));
}

inline void store(char* out, __m128i v) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out), v);
}

// What turns the digit values into characters, the sign in byte 0: for a positive and for a
// negative number.
constexpr Bytes16 to_characters[2] = {{0x3030303030303000 | ' ', 0x3030303030303030},
                                      {0x3030303030303000 | '-', 0x3030303030303030}};

// Byte masks for the point in byte `at` (2..16) of the sign-and-digits text: the bytes before
// it, the point itself, and the bytes after it (which take the text shifted one place on).
struct PointMasks {
    Bytes16 keep;
    Bytes16 point;
    Bytes16 shifted;
};

constexpr std::array<PointMasks, 15> make_point_masks() {
    std::array<PointMasks, 15> masks{};
    for (int e = 0; e < 15; ++e) {
        const int at = e + 2;
        for (int byte = 0; byte < 16; ++byte) {
            const uint64_t ones = uint64_t{0xFF} << (8 * (byte % 8));
            if (byte < at)
                masks[e].keep.w[byte / 8] |= ones;
            if (byte == at)
                masks[e].point.w[byte / 8] |= (ones / 0xFF) * '.';
            if (byte > at)
                masks[e].shifted.w[byte / 8] |= ones;
        }
    }
    return masks;
}

constexpr auto point_masks = make_point_masks();

// Stores the text with the point after e + 1 digits, 0 <= e < 15: 17 characters, the last from
// the first store, which the second overwrites up to there.
inline void store_with_point(char* out, __m128i text, int e) {
    const PointMasks& m = point_masks[e];
    store(out + 1, text);
    const __m128i kept = _mm_and_si128(text, load(m.keep));
    const __m128i moved = _mm_and_si128(_mm_slli_si128(text, 1), load(m.shifted));
    store(out, _mm_or_si128(_mm_or_si128(kept, moved), load(m.point)));
}

// A number's characters before the point goes in: the sign and the 15 digits, and how many
// digits remain without the trailing zeros.
struct Text {
    __m128i chars;  // the sign in byte 0, the digits in bytes 1..15
    int count;
};

[[gnu::always_inline]] inline Text text_of(uint64_t n, bool negative) {
    const __m128i values = digit_values(n);
    // The last non-zero digit (byte 0 is zero, the first digit never; the 1 keeps the count
    // defined for the rare numbers, whose n is not a 15-digit number).
    const unsigned nonzero =
        static_cast<unsigned>(_mm_movemask_epi8(_mm_cmpgt_epi8(values, _mm_setzero_si128())));
    const int count = 31 - std::countl_zero(nonzero | 1u);
    return {_mm_add_epi8(values, load(to_characters[negative])), count};
}

// Writes the text of t * 10^(e - 14) and returns its length; a rare number (e is rare_exponent)
// goes to format_rare. Each case stores 16 characters at a time and counts the ones that belong
// to the text; the farthest reach is 22 characters from out.
[[gnu::always_inline]] inline int place(char* out, const Text& t, int e, double value) {
    if (static_cast<unsigned>(e) < 15) {
        store_with_point(out, t.chars, e);
        return t.count > e + 1 ? t.count + 2 : e + 2;
    }
    if (static_cast<unsigned>(e + 4) < 4) {
        const uint64_t head = 0x3030303030302E00 | static_cast<unsigned>(_mm_cvtsi128_si32(t.chars) & 0xFF);
        std::memcpy(out, &head, 8);
        store(out + 1 - e, _mm_srli_si128(t.chars, 1));
        return 1 - e + t.count;
    }
    if (e == rare_exponent) [[unlikely]]
        return format_rare(out, value);
    const int mantissa = t.count > 1 ? t.count + 2 : 2;
    store_with_point(out, t.chars, 0);
    return mantissa + exponent_to(out + mantissa, e);
}

#else  // Without SSE2: the same in 64-bit registers.

// The digits of x < 10^8 as eight byte values 0..9, the first digit in the lowest byte: four
// digits per 32-bit lane, then two per 16-bit lane, then one per byte, all in one register.
inline uint64_t eight_digits(uint32_t x) {
    uint64_t v = (x / 10000) | (static_cast<uint64_t>(x % 10000) << 32);
    const uint64_t hundreds = ((v * 10486) >> 20) & 0x0000007F0000007FULL;  // lane / 100
    v = hundreds | ((v - hundreds * 100) << 16);
    const uint64_t tens = ((v * 103) >> 10) & 0x000F000F000F000FULL;  // lane / 10
    return tens | ((v - tens * 10) << 8);
}

// The 15 digits of 10^14 <= n < 10^15 as characters, digit i in byte i of lo:hi (byte 15 a
// spare '0'), and how many remain without the trailing zeros. The text is built in registers
// and stored whole: storing digits piecemeal and copying them on would make the processor wait
// for its store buffer.
struct Digits {
    uint64_t lo;
    uint64_t hi;
    int count;
};

inline Digits digits_of(uint64_t n) {
    const uint32_t high = static_cast<uint32_t>(n / 100000000);  // 7 digits, so byte 0 is 0
    const uint32_t low = static_cast<uint32_t>(n - static_cast<uint64_t>(high) * 100000000);
    const uint64_t a = eight_digits(high);
    const uint64_t b = eight_digits(low);
    const int trailing_zeros = b != 0 ? std::countl_zero(b) / 8 : 8 + std::countl_zero(a) / 8;
    constexpr uint64_t zeros = 0x3030303030303030ULL;
    return {((a >> 8) | (b << 56)) | zeros, (b >> 8) | zeros, 15 - trailing_zeros};
}

// Byte masks for a point before character `at` (1..15) of a 16-character text: the characters
// before it, the point itself, and the characters after it (shifted one place on).
struct PointMasks {
    uint64_t keep[2];
    uint64_t point[2];
    uint64_t shifted[2];
};

constexpr std::array<PointMasks, 16> make_point_masks() {
    std::array<PointMasks, 16> masks{};
    for (int at = 1; at < 16; ++at) {
        for (int byte = 0; byte < 16; ++byte) {
            const uint64_t ones = uint64_t{0xFF} << (8 * (byte % 8));
            if (byte < at)
                masks[at].keep[byte / 8] |= ones;
            if (byte == at)
                masks[at].point[byte / 8] |= (ones / 0xFF) * '.';
            if (byte > at)
                masks[at].shifted[byte / 8] |= ones;
        }
    }
    return masks;
}

constexpr auto point_masks = make_point_masks();

// Stores the 16 characters with a point inserted before character `at`; the last one drops out.
inline void store_with_point(char* out, const Digits& d, int at) {
    const PointMasks& m = point_masks[at];
    const uint64_t shifted_lo = d.lo << 8;
    const uint64_t shifted_hi = (d.hi << 8) | (d.lo >> 56);
    const uint64_t lo = (d.lo & m.keep[0]) | m.point[0] | (shifted_lo & m.shifted[0]);
    const uint64_t hi = (d.hi & m.keep[1]) | m.point[1] | (shifted_hi & m.shifted[1]);
    std::memcpy(out, &lo, 8);
    std::memcpy(out + 8, &hi, 8);
}

inline void store_digits(char* out, const Digits& d) {
    std::memcpy(out, &d.lo, 8);
    std::memcpy(out + 8, &d.hi, 8);
}

// A number's characters before the point goes in.
struct Text {
    Digits digits;
    char sign;
};

constexpr char sign_char(bool negative) {
    return negative ? '-' : ' ';
}

[[gnu::always_inline]] inline Text text_of(uint64_t n, bool negative) {
    return {digits_of(n), sign_char(negative)};
}

// Writes the text of t * 10^(e - 14) and returns its length; a rare number (e is rare_exponent)
// goes to format_rare. Each case stores 16 characters at once and counts the ones that belong
// to the text; the farthest reach is 22 characters from out.
[[gnu::always_inline]] inline int place(char* out, const Text& t, int e, double value) {
    if (e == rare_exponent) [[unlikely]]
        return format_rare(out, value);
    const int count = t.digits.count;
    out[0] = t.sign;
    if (static_cast<unsigned>(e) < 15) {
        store_with_point(out + 1, t.digits, e + 1);
        return count > e + 1 ? count + 2 : e + 2;
    }
    if (static_cast<unsigned>(e + 4) < 4) {
        std::memcpy(out + 1, ".000", 4);
        store_digits(out + 1 - e, t.digits);
        return 1 - e + count;
    }
    const int mantissa = count > 1 ? count + 2 : 2;
    store_with_point(out + 1, t.digits, 1);
    return mantissa + exponent_to(out + mantissa, e);
}

#endif

bool is_digit(char c) {
    return c >= '0' && c <= '9';
}
bool is_blank(char c) {
    return c == ' ' || c == '\t' || c == '\n' || c == '\r';
}

// The extent of a number in text: [sign] digits [. digits] [E|D [sign] digits], with at least
// one mantissa digit. The exponent belongs to the number only when it has a digit.
struct NumberSpan {
    size_t end = 0;            // one past the number; 0 when there is none
    size_t mantissa_from = 0;  // first character after the sign
    size_t exponent_at = 0;    // position of the E or D; 0 when there is no exponent
    bool negative = false;
    bool found = false;
    // Decimal magnitude estimate for out-of-range results: positive for an overflow.
    long long magnitude = 0;
};

NumberSpan scan_number(std::string_view s, size_t i) {
    NumberSpan span;
    if (i < s.size() && (s[i] == '+' || s[i] == '-')) {
        span.negative = s[i] == '-';
        ++i;
    }
    span.mantissa_from = i;
    long long whole_digits = 0;   // significant digits before the point
    long long leading_zeros = 0;  // zeros after the point before the first non-zero digit
    bool any_digit = false;
    bool nonzero_seen = false;
    for (; i < s.size() && is_digit(s[i]); ++i) {
        any_digit = true;
        if (s[i] != '0')
            nonzero_seen = true;
        if (nonzero_seen && whole_digits < 1'000'000'000)
            ++whole_digits;
    }
    if (i < s.size() && s[i] == '.') {
        ++i;
        for (; i < s.size() && is_digit(s[i]); ++i) {
            any_digit = true;
            if (s[i] != '0')
                nonzero_seen = true;
            if (!nonzero_seen && leading_zeros < 1'000'000'000)
                ++leading_zeros;
        }
    }
    if (!any_digit)
        return span;
    span.found = true;
    span.end = i;
    long long exponent = 0;
    if (i < s.size() && (s[i] == 'E' || s[i] == 'e' || s[i] == 'D' || s[i] == 'd')) {
        size_t j = i + 1;
        bool exp_negative = false;
        if (j < s.size() && (s[j] == '+' || s[j] == '-')) {
            exp_negative = s[j] == '-';
            ++j;
        }
        if (j < s.size() && is_digit(s[j])) {
            span.exponent_at = i;
            for (; j < s.size() && is_digit(s[j]); ++j)
                if (exponent < 1'000'000'000)
                    exponent = exponent * 10 + (s[j] - '0');
            if (exp_negative)
                exponent = -exponent;
            span.end = j;
        }
    }
    span.magnitude = (whole_digits > 0 ? whole_digits : -leading_zeros) + exponent;
    return span;
}

// The value of a scanned number. Beyond the double range it saturates: the largest finite
// magnitude for an overflow, zero for an underflow.
double convert(std::string_view s, const NumberSpan& span, bool* overflow = nullptr) {
    const char* first = s.data() + span.mantissa_from;
    const char* last = s.data() + span.end;
    std::string copy;
    if (span.exponent_at != 0 && (s[span.exponent_at] == 'D' || s[span.exponent_at] == 'd')) {
        copy.assign(first, last);
        copy[span.exponent_at - span.mantissa_from] = 'e';
        first = copy.data();
        last = copy.data() + copy.size();
    }
    double value = 0.0;
    const auto result = std::from_chars(first, last, value, std::chars_format::general);
    if (result.ec == std::errc::result_out_of_range) {
        value = span.magnitude > 0 ? DBL_MAX : 0.0;
        if (overflow != nullptr)
            *overflow = span.magnitude > 0;
    } else if (result.ec != std::errc{})
        value = 0.0;
    return span.negative ? -value : value;
}

std::optional<double> round_to_fit(double value, double low, double high) {
    if (std::isnan(value))
        return std::nullopt;
    double r = std::floor(value);
    const double fraction = value - r;  // exact: value and its floor share the binade's grid
    if (fraction > 0.5 || (fraction == 0.5 && std::fmod(r, 2.0) != 0.0))
        r += 1.0;
    if (!(r >= low && r <= high))
        return std::nullopt;
    return r;
}

// Zero, subnormals, infinities and NaN: kept out of the inlined common path.
[[gnu::noinline]] int format_rare(char* out, double value) {
    const bool negative = std::signbit(value);
    const double a = std::fabs(value);
    if (std::isnan(value)) {
        std::memcpy(out, "NaN", 3);
        return 3;
    }
    if (a > DBL_MAX) {
        std::memcpy(out, negative ? "-Inf" : " Inf", 4);
        return 4;
    }
    if (a == 0.0) {
        std::memcpy(out, " 0", 2);
        return 2;
    }
    const Decimal15 d = round15<false>(a);
    return place(out, text_of(d.digits, negative), d.exp10, value);
}

constexpr uint64_t sign_bit = uint64_t{1} << 63;

[[gnu::always_inline]] inline int format_one(char* out, double value) {
    const uint64_t bits = std::bit_cast<uint64_t>(value);
    const Decimal15 d = round15_fast(bits & ~sign_bit);
    return place(out, text_of(d.digits, (bits & sign_bit) != 0), d.exp10, value);
}

}  // namespace

int format_to(char* buffer, double value) {
    return format_one(buffer, value);
}

size_t format_lines(char* buffer, const double* values, size_t count, std::string_view before,
                    std::string_view after) {
    char* out = buffer;
    const auto append = [&out](std::string_view s) {
        if (!s.empty())
            std::memcpy(out, s.data(), s.size());
        out += s.size();
    };
    if (before.size() > 8 || after.size() > 8) {
        for (size_t i = 0; i < count; ++i) {
            append(before);
            out += format_one(out, values[i]);
            append(after);
        }
        return static_cast<size_t>(out - buffer);
    }
    // Both ends are stored as one 8-byte word each; what follows overwrites the rest.
    uint64_t before_word = 0, after_word = 0;
    if (!before.empty())
        std::memcpy(&before_word, before.data(), before.size());
    if (!after.empty())
        std::memcpy(&after_word, after.data(), after.size());
    // A batch at a time: the roundings, then the digits, then the texts. The chain of work from
    // a number to its text is long, and the processor overlaps only a few such chains; each step
    // alone is short, so it overlaps many numbers. This makes a block about a third faster.
    constexpr size_t batch = 64;
    Decimal15 decimals[batch];
    Text texts[batch];
    for (size_t first = 0; first < count; first += batch) {
        const double* v = values + first;
        const size_t n = std::min(batch, count - first);
        for (size_t i = 0; i < n; ++i)
            decimals[i] = round15_fast(std::bit_cast<uint64_t>(v[i]) & ~sign_bit);
        for (size_t i = 0; i < n; ++i)
            texts[i] = text_of(decimals[i].digits, (std::bit_cast<uint64_t>(v[i]) & sign_bit) != 0);
        for (size_t i = 0; i < n; ++i) {
            std::memcpy(out, &before_word, 8);
            out += before.size();
            out += place(out, texts[i], decimals[i].exp10, v[i]);
            std::memcpy(out, &after_word, 8);
            out += after.size();
        }
    }
    return static_cast<size_t>(out - buffer);
}

std::string str(double value) {
    char buffer[32];
    return std::string(buffer, static_cast<size_t>(format_to(buffer, value)));
}

std::string text(double value) {
    char buffer[32];
    const int n = format_to(buffer, value);
    return buffer[0] == ' ' ? std::string(buffer + 1, static_cast<size_t>(n - 1))
                            : std::string(buffer, static_cast<size_t>(n));
}

double val(std::string_view text) {
    size_t i = 0;
    while (i < text.size() && is_blank(text[i]))
        ++i;
    const NumberSpan span = scan_number(text, i);
    return span.found ? convert(text, span) : 0.0;
}

std::optional<double> to_number(std::string_view text) {
    size_t i = 0;
    while (i < text.size() && is_blank(text[i]))
        ++i;
    const NumberSpan span = scan_number(text, i);
    if (!span.found)
        return std::nullopt;
    size_t j = span.end;
    while (j < text.size() && is_blank(text[j]))
        ++j;
    if (j != text.size())
        return std::nullopt;
    // Beyond the largest double is not a number the panel can hold; below the smallest is 0.
    bool overflow = false;
    const double value = convert(text, span, &overflow);
    if (overflow)
        return std::nullopt;
    return value;
}

std::optional<int16_t> to_int16(double value) {
    const auto r = round_to_fit(value, -32768.0, 32767.0);
    if (!r)
        return std::nullopt;
    return static_cast<int16_t>(*r);
}

std::optional<int32_t> to_int32(double value) {
    const auto r = round_to_fit(value, -2147483648.0, 2147483647.0);
    if (!r)
        return std::nullopt;
    return static_cast<int32_t>(*r);
}

}  // namespace numtext
