#include "Runtime/Utilities/UTF8.h"

#include <cstddef>

namespace
{
    const uint16_t kHighSurrogateFirst = 0xD800;
    const uint16_t kHighSurrogateLast = 0xDBFF;
    const uint16_t kLowSurrogateFirst = 0xDC00;
    const uint16_t kLowSurrogateLast = 0xDFFF;

    bool IsHighSurrogate(uint32_t u) { return u >= kHighSurrogateFirst && u <= kHighSurrogateLast; }
    bool IsLowSurrogate(uint32_t u) { return u >= kLowSurrogateFirst && u <= kLowSurrogateLast; }

    // Length of the sequence a lead byte opens; 0 for a byte that cannot lead (continuation
    // bytes, the overlong leads C0 and C1, and F5..FF, which would exceed U+10FFFF).
    int SequenceLength(uint8_t lead)
    {
        if (lead < 0x80)
            return 1;
        if (lead >= 0xC2 && lead <= 0xDF)
            return 2;
        if (lead >= 0xE0 && lead <= 0xEF)
            return 3;
        if (lead >= 0xF0 && lead <= 0xF4)
            return 4;
        return 0;
    }

    // The second byte carries the remaining range checks: no overlong three- and four-byte
    // forms, no surrogates (ED A0..BF), nothing above U+10FFFF (F4 90..).
    bool IsLegalSecondByte(uint8_t lead, uint8_t second)
    {
        uint8_t low = 0x80, high = 0xBF;
        if (lead == 0xE0)
            low = 0xA0;
        else if (lead == 0xED)
            high = 0x9F;
        else if (lead == 0xF0)
            low = 0x90;
        else if (lead == 0xF4)
            high = 0x8F;
        return second >= low && second <= high;
    }

    bool IsContinuation(uint8_t b) { return b >= 0x80 && b <= 0xBF; }

    // Checks the `available` bytes of a sequence of `length` (available may be short of it).
    bool PresentBytesLegal(const uint8_t* s, int length, int available)
    {
        if (length == 0)
            return false;
        if (available >= 2 && !IsLegalSecondByte(s[0], s[1]))
            return false;
        for (int i = 2; i < available && i < length; ++i)
        {
            if (!IsContinuation(s[i]))
                return false;
        }
        return true;
    }

    uint32_t DecodeSequence(const uint8_t* s, int length)
    {
        static const uint8_t kLeadMask[5] = {0, 0x7F, 0x1F, 0x0F, 0x07};
        uint32_t value = s[0] & kLeadMask[length];
        for (int i = 1; i < length; ++i)
            value = (value << 6) | (s[i] & 0x3F);
        return value;
    }

    int EncodedLength(uint32_t value)
    {
        if (value < 0x80)
            return 1;
        if (value < 0x800)
            return 2;
        if (value < 0x10000)
            return 3;
        return 4;
    }

    void EncodeSequence(uint32_t value, int length, uint8_t* out)
    {
        static const uint8_t kLeadMark[5] = {0, 0x00, 0xC0, 0xE0, 0xF0};
        for (int i = length - 1; i > 0; --i)
        {
            out[i] = static_cast<uint8_t>(0x80 | (value & 0x3F));
            value >>= 6;
        }
        out[0] = static_cast<uint8_t>(kLeadMark[length] | value);
    }
}

ConversionResult ConvertUTF8toUTF16(const uint8_t** sourceStart, const uint8_t* sourceEnd, uint16_t** targetStart,
                                    uint16_t* targetEnd, ConversionFlags /*flags: UTF-8 input has no lenient form*/)
{
    const uint8_t* source = *sourceStart;
    uint16_t* target = *targetStart;
    ConversionResult result = conversionOK;
    while (source < sourceEnd)
    {
        const int length = SequenceLength(*source);
        const long left = sourceEnd - source;
        const int available = left < length ? static_cast<int>(left) : length;
        if (!PresentBytesLegal(source, length, available))
        {
            result = sourceIllegal;
            break;
        }
        if (available < length)
        {
            result = sourceExhausted;
            break;
        }
        const uint32_t value = DecodeSequence(source, length);
        const int units = value > 0xFFFF ? 2 : 1;
        if (targetEnd - target < units)
        {
            result = targetExhausted;
            break;
        }
        if (units == 1)
            *target++ = static_cast<uint16_t>(value);
        else
        {
            const uint32_t offset = value - 0x10000;
            *target++ = static_cast<uint16_t>(kHighSurrogateFirst + (offset >> 10));
            *target++ = static_cast<uint16_t>(kLowSurrogateFirst + (offset & 0x3FF));
        }
        source += length;
    }
    *sourceStart = source;
    *targetStart = target;
    return result;
}

ConversionResult ConvertUTF16toUTF8(const uint16_t** sourceStart, const uint16_t* sourceEnd, uint8_t** targetStart,
                                    uint8_t* targetEnd, ConversionFlags flags)
{
    const uint16_t* source = *sourceStart;
    uint8_t* target = *targetStart;
    ConversionResult result = conversionOK;
    while (source < sourceEnd)
    {
        uint32_t value = *source;
        int consumed = 1;
        if (IsHighSurrogate(value))
        {
            if (source + 1 >= sourceEnd)
            {
                result = sourceExhausted;
                break;
            }
            if (IsLowSurrogate(source[1]))
            {
                value = 0x10000 + ((value - kHighSurrogateFirst) << 10) + (source[1] - kLowSurrogateFirst);
                consumed = 2;
            }
            else if (flags == strictConversion)
            {
                result = sourceIllegal;
                break;
            }
        }
        else if (IsLowSurrogate(value) && flags == strictConversion)
        {
            result = sourceIllegal;
            break;
        }
        const int length = EncodedLength(value);
        if (targetEnd - target < length)
        {
            result = targetExhausted;
            break;
        }
        EncodeSequence(value, length, target);
        target += length;
        source += consumed;
    }
    *sourceStart = source;
    *targetStart = target;
    return result;
}

bool ConvertUTF8toUTF16(const char* source, int srcLength, uint16_t* output, int& outlength)
{
    const int count = srcLength > 0 ? srcLength : 0;
    const uint8_t* src = reinterpret_cast<const uint8_t*>(source);
    uint16_t* dst = output;
    // A UTF-8 sequence of n bytes never needs more than n UTF-16 units.
    const ConversionResult result = ConvertUTF8toUTF16(&src, src + count, &dst, output + count, lenientConversion);
    if (result == sourceIllegal)
    {
        outlength = 0;
        return false;
    }
    outlength = static_cast<int>(dst - output);
    return true;
}

bool ConvertUTF16toUTF8(const uint16_t* source, int srcLength, char* output, int& outlength)
{
    const int count = srcLength > 0 ? srcLength : 0;
    const uint16_t* src = source;
    uint8_t* begin = reinterpret_cast<uint8_t*>(output);
    uint8_t* dst = begin;
    // One UTF-16 unit never needs more than 4 bytes (a pair needs 4 for two units).
    const ConversionResult result =
        ConvertUTF16toUTF8(&src, src + count, &dst, begin + 4 * static_cast<size_t>(count), lenientConversion);
    if (result == sourceIllegal)
    {
        outlength = 0;
        return false;
    }
    outlength = static_cast<int>(dst - begin);
    return true;
}
