#include "Editor/Tools/Unwrap/source/CLTool/ObjNumberScan.h"

#include <charconv>
#include <cstdlib>
#include <cstring>
#include <xmmintrin.h>

namespace ObjNumberScan
{
    // Rounding field (bits 13-14) to nearest, flush-to-zero (bit 15) and denormals-are-zero (bit 6) off.
    FloatScanner::FloatScanner() : m_CallerState(_mm_getcsr())
    {
        _mm_setcsr(m_CallerState & ~0xE040u);
    }

    FloatScanner::~FloatScanner()
    {
        _mm_setcsr(m_CallerState);
    }

    // strtof on a zero-terminated copy of at most one piece, in the caller's state: the rare
    // forms and the range errors.
    const char* FloatScanner::ScanByStrtof(const char* text, const char* end, float* value) const
    {
        char piece[kMaxPieceChars + 1];
        size_t length = (size_t)(end - text);
        if (length > sizeof piece - 1)
            length = sizeof piece - 1;
        std::memcpy(piece, text, length);
        piece[length] = 0;
        char* stop;
        unsigned scanState = _mm_getcsr();
        _mm_setcsr(m_CallerState);
        float parsed = std::strtof(piece, &stop);
        _mm_setcsr(scanState);
        if (stop == piece)
            return nullptr;
        *value = parsed;
        return text + (stop - piece);
    }

    const char* FloatScanner::Scan(const char* text, const char* end, float* value) const
    {
        const char* p = text;
        while (p < end && IsBlank(*p))
            ++p;
        bool negative = false;
        const char* digits = p;
        if (digits < end && (*digits == '-' || *digits == '+'))
            negative = *digits++ == '-';
        // A plain decimal number: a digit (but not the "0x" of a hexadecimal one), or a point
        // followed by a digit.
        bool decimal = digits < end &&
                       ((IsDigit(*digits) && !(*digits == '0' && digits + 1 < end && (digits[1] | 0x20) == 'x')) ||
                        (*digits == '.' && digits + 1 < end && IsDigit(digits[1])));
        if (decimal)
        {
            float parsed;
            std::from_chars_result r = std::from_chars(digits, end, parsed, std::chars_format::general);
            if (r.ec == std::errc())
            {
                *value = negative ? -parsed : parsed;
                return r.ptr;
            }
        }
        return ScanByStrtof(p, end, value);
    }
}
