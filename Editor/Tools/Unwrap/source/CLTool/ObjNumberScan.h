#pragma once
// The two number fields of OBJ lines, "%f" and "%u", scanned from a bounded piece of text as the
// formatted-input functions scan them, so that a mapped file needs no terminating zero.
//
// "%f" gives what strtof gives in the caller's floating-point state, bit for bit: leading
// blanks, an optional sign, then a decimal number (std::from_chars, correctly rounded to nearest,
// as strtof rounds whatever the SSE rounding mode is) or, for anything else strtof accepts
// (hexadecimal, inf, nan) and for results beyond the float range, strtof itself on a
// zero-terminated copy of the rest of the piece. from_chars computes with SSE arithmetic on its
// fast path, so a FloatScanner holds the SSE state at round-to-nearest while it lives, and puts
// the caller's state back around each strtof call: strtof's answers past the float range come
// from SSE arithmetic and follow that state (toward zero, 1e39 gives FLT_MAX, not infinity).
//
// "%u" gives what strtoul in base 10 gives, truncated to 32 bits: leading blanks, an optional
// sign (a minus negates modulo 2^64), decimal digits; a value beyond 64 bits saturates.
//
// Both return the position after the number, or nullptr when no number is there (nothing stored).
// Cost: one pass over the number's characters; the strtof path copies at most one piece.

#include <cstdint>

namespace ObjNumberScan
{
    // Longest piece of a line that the reader hands over at once (its 1,024-byte line buffer).
    constexpr long kMaxPieceChars = 1023;

    inline bool IsBlank(char c) { return c == ' ' || (c >= '\t' && c <= '\r'); }   // of the C locale
    inline bool IsDigit(char c) { return (unsigned)(c - '0') < 10; }

    // Inline: a face line holds nine of these, and the call would cost as much as the scan.
    inline const char* ScanUnsigned(const char* text, const char* end, uint32_t* value)
    {
        const char* p = text;
        while (p < end && IsBlank(*p))
            ++p;
        bool negative = false;
        if (p < end && (*p == '-' || *p == '+'))
            negative = *p++ == '-';
        if (p == end || !IsDigit(*p))
            return nullptr;
        // Up to 19 digits cannot overflow 64 bits; longer numbers are checked digit by digit.
        const char* digits = p;
        uint64_t parsed = 0;
        for (; p < end && IsDigit(*p) && p - digits < 19; ++p)
            parsed = parsed * 10 + unsigned(*p - '0');
        bool overflow = false;
        for (; p < end && IsDigit(*p); ++p)
            overflow |= __builtin_mul_overflow(parsed, 10u, &parsed) | __builtin_add_overflow(parsed, unsigned(*p - '0'), &parsed);
        if (overflow)
            parsed = ~0ull;
        else if (negative)
            parsed = 0 - parsed;
        *value = (uint32_t)parsed;
        return p;
    }

    class FloatScanner
    {
    public:
        // Round to nearest, no flush-to-zero, no denormals-are-zero until destruction, which
        // restores the SSE control register.
        FloatScanner();
        ~FloatScanner();
        FloatScanner(const FloatScanner&) = delete;
        FloatScanner& operator=(const FloatScanner&) = delete;

        const char* Scan(const char* text, const char* end, float* value) const;

    private:
        const char* ScanByStrtof(const char* text, const char* end, float* value) const;

        unsigned m_CallerState;
    };
}
