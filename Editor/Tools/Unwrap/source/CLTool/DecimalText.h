#pragma once
// Decimal text of the numbers in an OBJ file, character for character what printf prints, at a
// fraction of its cost: "%u" of an unsigned integer and "%f" of a float widened to double.
//
// Every finite float is m * 2^e with m < 2^24 and -149 <= e <= 104, so its "%f" text is worked out
// in integers alone: for e >= 0 the value is the integer m << e (below 2^128); for e < 0 the text
// is the value times 10^6, m * 10^6 / 2^-e (m * 10^6 < 2^44), rounded to the nearest integer with
// ties to even, as printf rounds here: it follows the x87 rounding mode, which stays at to-nearest,
// not the SSE mode the driver sets to toward zero. No floating-point operation is involved, so the
// text does not depend on either mode. NaN and the infinities go to snprintf.

#include <bit>
#include <cstdint>
#include <cstdio>
#include <cstring>

namespace DecimalText
{
    // Longest text of a finite float: '-', the 39 digits of the largest float, '.', six decimals.
    constexpr size_t kMaxFloatChars = 47;
    // Longest text of a 64-bit unsigned integer.
    constexpr size_t kMaxUnsignedChars = 20;

    namespace Detail
    {
        constexpr char kDigitPairs[] =
            "00010203040506070809101112131415161718192021222324252627282930313233343536373839"
            "40414243444546474849505152535455565758596061626364656667686970717273747576777879"
            "8081828384858687888990919293949596979899";

        inline void WritePair(unsigned pair, char* at) { std::memcpy(at, kDigitPairs + 2 * pair, 2); }

        // Writes the decimal digits of `value` so that they end just before `end`; returns their start.
        template <typename Unsigned>
        char* WriteDigitsBackward(Unsigned value, char* end)
        {
            while (value >= 100)
            {
                end -= 2;
                WritePair(unsigned(value % 100), end);
                value /= 100;
            }
            if (value >= 10)
            {
                end -= 2;
                WritePair(unsigned(value), end);
            }
            else
                *--end = char('0' + value);
            return end;
        }

        inline char* WriteDigits(uint64_t value, char* out)
        {
            unsigned count = 1;
            for (uint64_t power = 10; count < 20 && value >= power; power *= 10)
                ++count;
            WriteDigitsBackward(value, out + count);
            return out + count;
        }

        inline char* WriteDigits(unsigned __int128 value, char* out)
        {
            char digits[40];   // 2^128 has 39 digits
            char* begin = WriteDigitsBackward(value, digits + sizeof digits);
            size_t count = size_t(digits + sizeof digits - begin);
            std::memcpy(out, begin, count);
            return out + count;
        }

        // "." and exactly six digits of `millionths` (below 10^6).
        inline char* WriteSixDecimals(uint32_t millionths, char* out)
        {
            out[0] = '.';
            WritePair(millionths / 10000, out + 1);
            WritePair(millionths / 100 % 100, out + 3);
            WritePair(millionths % 100, out + 5);
            return out + 7;
        }

        // `scaled` / 2^shift rounded to the nearest integer, ties to even.
        inline uint64_t RoundedShift(uint64_t scaled, unsigned shift)
        {
            if (shift >= 64)
                return 0;   // scaled < 2^44 is below half of 2^shift
            uint64_t quotient = scaled >> shift;
            uint64_t rest = scaled & ((uint64_t(1) << shift) - 1);
            uint64_t half = uint64_t(1) << (shift - 1);
            return quotient + (rest > half || (rest == half && (quotient & 1)));
        }
    }

    // Writes `value` as "%u" does (no terminator) and returns the end; needs kMaxUnsignedChars bytes.
    inline char* WriteUnsigned(uint64_t value, char* out)
    {
        return Detail::WriteDigits(value, out);
    }

    // Writes `value` as "%f" does with (double)value (no terminator) and returns the end; needs
    // kMaxFloatChars bytes. Negative values keep their '-' even when they round to zero ("-0.000000").
    inline char* WriteFixed6(float value, char* out)
    {
        const uint32_t bits = std::bit_cast<uint32_t>(value);
        const uint32_t exponentField = (bits >> 23) & 0xFF;
        if (exponentField == 0xFF)
        {
            char text[8];   // "nan", "-nan", "inf", "-inf"
            int length = std::snprintf(text, sizeof text, "%f", double(value));
            std::memcpy(out, text, size_t(length));
            return out + length;
        }
        if (bits >> 31)
            *out++ = '-';
        uint64_t mantissa = bits & 0x7FFFFF;
        int exponent = -149;   // denormals: 0.mantissa * 2^-126
        if (exponentField != 0)
        {
            mantissa |= 0x800000;
            exponent = int(exponentField) - 150;
        }
        if (exponent >= 0)
        {
            // An integer; below 2^64 up to exponent 40, below 2^128 beyond.
            out = exponent <= 40 ? Detail::WriteDigits(mantissa << exponent, out)
                                 : Detail::WriteDigits((unsigned __int128)mantissa << exponent, out);
            return Detail::WriteSixDecimals(0, out);
        }
        const uint64_t millionths = Detail::RoundedShift(mantissa * 1000000, unsigned(-exponent));
        out = Detail::WriteDigits(millionths / 1000000, out);
        return Detail::WriteSixDecimals(uint32_t(millionths % 1000000), out);
    }
}
