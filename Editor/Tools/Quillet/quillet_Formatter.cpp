#include "Editor/Tools/Quillet/quillet_Formatter.h"

#include <emmintrin.h>
#include <errno.h>
#include <stdint.h>
#include <string.h>

namespace
{
    const int kFlagMinus = 1;
    const int kFlagPlus = 2;
    const int kFlagSpace = 4;
    const int kFlagAlternate = 8;  // accepted and ignored
    const int kFlagZero = 16;
    const int kFlagUpper = 32;
    const int kFlagUnsigned = 64;

    enum LengthClass { kLengthNone, kLengthShort, kLengthLong, kLengthLongDouble, kLengthLongLong, kLengthSize, kLengthMax };
    enum ParserState { kStateDefault, kStateFlags, kStateWidth, kStateDot, kStatePrecision, kStateLength, kStateConversion };

    const size_t kMaxOutput = 0x7FFFFFFE;  // the output position may never reach 0x7FFFFFFF
    const int kIntegerPlaces = 20;
    const int kFloatPlaces = 311;
    const int kMaxFloatPrecision = 16;
    const int kModfRounds = 100;
    const char kLowerDigits[] = "0123456789abcdef";
    const char kUpperDigits[] = "0123456789ABCDEF";

    // Truncation with the processor's semantics: out-of-range values and NaN give the minimum
    // value instead of undefined behaviour, as the formatter's arithmetic expects on this machine.
    int64_t TruncToInt64(double v) { return _mm_cvttsd_si64(_mm_set_sd(v)); }
    int TruncToInt32(double v) { return _mm_cvttsd_si32(_mm_set_sd(v)); }

    // The Windows x64 argument list: every argument fills one 8-byte slot.
    class WindowsArgList
    {
    public:
        explicit WindowsArgList(const char* first) : m_Next(first) {}
        int32_t Int32() { return Read<int32_t>(); }
        uint32_t UInt32() { return Read<uint32_t>(); }
        int64_t Int64() { return Read<int64_t>(); }
        double Double() { return Read<double>(); }
        void* Pointer() { return Read<void*>(); }

    private:
        template<typename T> T Read()
        {
            static_assert(sizeof(T) <= 8, "one argument is one slot");
            T value;
            memcpy(&value, m_Next, sizeof(T));
            m_Next += 8;
            return value;
        }
        const char* m_Next;
    };

    // The output position and the one output step every written character goes through.
    struct Output
    {
        char* buffer;
        size_t maxlen;
        size_t currlen;
        bool overflow;

        // False (once, setting errno) when one more character would pass the output limit.
        bool Room()
        {
            if (!overflow && currlen + 1 > kMaxOutput)
            {
                errno = ERANGE;
                overflow = true;
            }
            return !overflow;
        }

        void Put(char c)
        {
            if (!Room())
                return;
            if (currlen < maxlen)
                buffer[currlen] = c;
            ++currlen;
        }

        // "%c": the argument is taken from the list only when it is stored.
        void PutCharArgument(WindowsArgList& args)
        {
            if (!Room())
                return;
            if (currlen < maxlen)
                buffer[currlen] = static_cast<char>(args.Int32());
            ++currlen;
        }

        // The same as `count` output steps. Past the buffer's end the characters are only counted,
        // so a huge width costs no time there.
        void PutRepeated(char c, int64_t count)
        {
            for (; count > 0 && !overflow && currlen < maxlen; --count)
                Put(c);
            if (count <= 0 || overflow)
                return;
            const uint64_t stepsLeft = kMaxOutput - currlen;
            if (static_cast<uint64_t>(count) > stepsLeft)
            {
                currlen = kMaxOutput;
                Room();  // fails now: sets errno and the overflow
                return;
            }
            currlen += static_cast<size_t>(count);
        }
    };

    struct ConversionFields
    {
        int flags = 0;
        int min = 0;   // width
        int max = -1;  // precision, -1 when none was given
        int length = kLengthNone;
    };

    char SignOf(bool negative, int flags)
    {
        if (negative)
            return '-';
        if (flags & kFlagPlus)
            return '+';
        if (flags & kFlagSpace)
            return ' ';
        return 0;
    }
}

static double my_modf(double x0, double* iptr)
{
    double x = x0;
    double f = 1.0;
    int64_t l = 0;
    int round = 0;
    for (; round < kModfRounds; ++round)
    {
        l = TruncToInt64(x);
        if (l <= x + 1 && l >= x - 1)
            break;
        x *= 0.1;
        f *= 10.0;
    }
    if (round == kModfRounds)
    {
        *iptr = 0;
        return 0;
    }
    if (round == 0)
    {
        *iptr = static_cast<double>(l);
        return x - *iptr;
    }
    // Scaled down to fit an integer: take the leading digits, then the rest on its own.
    double restInteger = 0;
    double fraction = my_modf(x0 - static_cast<double>(l) * f, &restInteger);
    *iptr = static_cast<double>(l) * f + restInteger;
    return fraction;
}

static void fmtint(Output& out, int64_t value, int base, int min, int max, int flags)
{
    if (max < 0)
        max = 0;
    uint64_t uvalue = static_cast<uint64_t>(value);
    char sign = 0;
    if (!(flags & kFlagUnsigned))
    {
        sign = SignOf(value < 0, flags);
        if (value < 0)
            uvalue = 0 - uvalue;
    }

    const char* digits = (flags & kFlagUpper) ? kUpperDigits : kLowerDigits;
    char convert[kIntegerPlaces];
    int place = 0;
    do
    {
        convert[place++] = digits[uvalue % base];
        uvalue /= base;
    } while (uvalue && place < kIntegerPlaces);
    if (place == kIntegerPlaces)
        --place;  // a 20th digit is dropped: only the lowest 19 are printed

    int64_t zpadlen = int64_t(max) - place;
    int64_t spadlen = int64_t(min) - (max > place ? max : place) - (sign ? 1 : 0);
    if (zpadlen < 0)
        zpadlen = 0;
    if (spadlen < 0)
        spadlen = 0;
    if (flags & kFlagZero)
    {
        zpadlen = zpadlen > spadlen ? zpadlen : spadlen;
        spadlen = 0;
    }
    if (flags & kFlagMinus)
        spadlen = -spadlen;

    out.PutRepeated(' ', spadlen);
    if (sign)
        out.Put(sign);
    out.PutRepeated('0', zpadlen);
    while (place > 0)
        out.Put(convert[--place]);
    out.PutRepeated(' ', -spadlen);
}

// Digits of a non-negative integral value, least significant first; returns how many were made.
static int FloatDigits(double value, const char* digits, char* convert)
{
    int place = 0;
    do
    {
        double t = value * 0.1;
        my_modf(t, &value);
        int idx = TruncToInt32((t - value + 0.05) * 10.0);
        // Only a value that was never a finite number can leave the table's range.
        idx = idx < 0 ? 0 : (idx > 15 ? 15 : idx);
        convert[place++] = digits[idx];
    } while (value != 0 && place < kFloatPlaces);
    if (place == kFloatPlaces)
        --place;
    return place;
}

static int64_t RoundHalfUp(double v)
{
    int64_t truncated = TruncToInt64(v);
    if (v - static_cast<double>(truncated) >= 0.5)
        ++truncated;
    return truncated;
}

static void fmtfp(Output& out, double fvalue, int min, int max, int flags)
{
    char sign = SignOf(fvalue < 0, flags);
    double ufvalue = fvalue < 0 ? -fvalue : fvalue;
    // Only the "none given" value means the default; any other negative precision (from "*")
    // is kept: no fraction digits, no point, and it widens the padding.
    if (max == -1)
        max = 6;
    if (max > kMaxFloatPrecision)
        max = kMaxFloatPrecision;

    double intpart = 0;
    my_modf(ufvalue, &intpart);
    double scale = 1.0;
    for (int i = 0; i < max; ++i)
        scale *= 10.0;
    double fracpart = static_cast<double>(RoundHalfUp(scale * (ufvalue - intpart)));
    if (fracpart >= scale)
    {
        intpart += 1;
        fracpart -= scale;
    }

    const char* digits = (flags & kFlagUpper) ? kUpperDigits : kLowerDigits;
    char iconvert[kFloatPlaces];
    char fconvert[kFloatPlaces];
    int iplace = FloatDigits(intpart, digits, iconvert);
    int fplace = fracpart != 0 ? FloatDigits(fracpart, digits, fconvert) : 0;

    // The point is counted even when it is not printed, and the sign is counted here and again
    // below when zero-padding: both are intended.
    int64_t padlen = int64_t(min) - iplace - max - 1 - (sign ? 1 : 0);
    int zpadlen = max - fplace;
    if (zpadlen < 0)
        zpadlen = 0;
    if (padlen < 0)
        padlen = 0;
    if (flags & kFlagMinus)
        padlen = -padlen;

    if ((flags & kFlagZero) && padlen > 0)
    {
        if (sign)
        {
            out.Put(sign);
            --padlen;
            sign = 0;
        }
        out.PutRepeated('0', padlen);
        padlen = 0;
    }
    out.PutRepeated(' ', padlen);
    if (sign)
        out.Put(sign);
    while (iplace > 0)
        out.Put(iconvert[--iplace]);
    if (max > 0)
    {
        out.Put('.');
        out.PutRepeated('0', zpadlen);
        while (fplace > 0)
            out.Put(fconvert[--fplace]);
    }
    out.PutRepeated(' ', -padlen);
}

static void fmtstr(Output& out, const char* value, int flags, int min, int max)
{
    int strln = 0;
    while (strln < max && value[strln])
        ++strln;
    int64_t padlen = int64_t(min) - strln;
    if (padlen < 0)
        padlen = 0;
    if (flags & kFlagMinus)
        padlen = -padlen;

    // Every character written, pad or text, counts toward the precision.
    int cnt = 0;
    if (padlen > 0 && cnt < max)
    {
        int spaces = static_cast<int>(padlen < max - cnt ? padlen : max - cnt);
        out.PutRepeated(' ', spaces);
        cnt += spaces;
    }
    for (; *value && cnt < max; ++value, ++cnt)
        out.Put(*value);
    if (padlen < 0 && cnt < max)
        out.PutRepeated(' ', -padlen < max - cnt ? -padlen : max - cnt);
}

namespace
{
    void ConvertString(Output& out, const char* value, const ConversionFields& conv)
    {
        if (!value)
            value = "(NULL)";
        int max = conv.max;
        if (max == -1)
            max = static_cast<int>(strnlen(value, 0x7FFFFFFF));
        if (conv.min > 0 && max >= 0 && conv.min > max)
            max = conv.min;
        fmtstr(out, value, conv.flags, conv.min, max);
    }

    void StoreCount(void* target, size_t currlen, int length)
    {
        if (!target)
            return;
        if (length == kLengthShort)
        {
            int16_t v = static_cast<int16_t>(currlen);
            memcpy(target, &v, sizeof v);
        }
        else if (length == kLengthLong || length == kLengthLongLong || length == kLengthSize || length == kLengthMax)
        {
            int64_t v = static_cast<int64_t>(currlen);
            memcpy(target, &v, sizeof v);
        }
        else
        {
            int32_t v = static_cast<int32_t>(currlen);
            memcpy(target, &v, sizeof v);
        }
    }

    int64_t SignedArgument(WindowsArgList& args, int length)
    {
        bool wide = length == kLengthLong || length == kLengthLongLong || length == kLengthSize || length == kLengthMax;
        return wide ? args.Int64() : args.Int32();
    }

    int64_t UnsignedArgument(WindowsArgList& args, int length)
    {
        bool wide = length == kLengthLong || length == kLengthLongLong || length == kLengthSize;
        return wide ? args.Int64() : static_cast<int64_t>(args.UInt32());
    }

    // One conversion character; returns true when the next format character is to be skipped.
    bool Convert(Output& out, WindowsArgList& args, char conversion, ConversionFields& conv)
    {
        const int unsignedFlags = conv.flags | kFlagUnsigned;
        switch (conversion)
        {
        case 'd':
        case 'i': fmtint(out, SignedArgument(args, conv.length), 10, conv.min, conv.max, conv.flags); break;
        case 'o': fmtint(out, UnsignedArgument(args, conv.length), 8, conv.min, conv.max, unsignedFlags); break;
        case 'u': fmtint(out, UnsignedArgument(args, conv.length), 10, conv.min, conv.max, unsignedFlags); break;
        case 'x': fmtint(out, UnsignedArgument(args, conv.length), 16, conv.min, conv.max, unsignedFlags); break;
        case 'X': fmtint(out, UnsignedArgument(args, conv.length), 16, conv.min, conv.max, unsignedFlags | kFlagUpper); break;
        case 'f':
        case 'e':
        case 'g': fmtfp(out, args.Double(), conv.min, conv.max, conv.flags); break;
        case 'E':
        case 'G': fmtfp(out, args.Double(), conv.min, conv.max, conv.flags | kFlagUpper); break;
        case 'c': out.PutCharArgument(args); break;
        case 's': ConvertString(out, static_cast<const char*>(args.Pointer()), conv); break;
        case 'p': fmtint(out, args.Int64(), 16, conv.min, conv.max, conv.flags); break;
        case 'n': StoreCount(args.Pointer(), out.currlen, conv.length); break;
        case '%': out.Put('%'); break;
        case 'w': return true;
        default: break;
        }
        return false;
    }

    bool IsDigit(char c) { return c >= '0' && c <= '9'; }

    // 10 * value + digit, wrapping instead of overflowing for absurdly long digit runs.
    int AppendDigit(int value, char c) { return static_cast<int>(10u * static_cast<unsigned>(value) + unsigned(c - '0')); }

    int FlagOf(char c)
    {
        switch (c)
        {
        case '-': return kFlagMinus;
        case '+': return kFlagPlus;
        case ' ': return kFlagSpace;
        case '#': return kFlagAlternate;
        case '0': return kFlagZero;
        default: return 0;
        }
    }

    // Walks the format one character at a time; `ch` is the character being looked at, `format`
    // points just past it.
    struct Parser
    {
        const char* format = nullptr;
        char ch = 0;
        ParserState state = kStateDefault;
        ConversionFields conv;

        void Next() { ch = *format++; }

        void Flags()
        {
            if (int flag = FlagOf(ch))
            {
                conv.flags |= flag;
                Next();
            }
            else
                state = kStateWidth;
        }

        void Width(WindowsArgList& args)
        {
            if (IsDigit(ch))
            {
                conv.min = AppendDigit(conv.min, ch);
                Next();
            }
            else if (ch == '*')
            {
                conv.min = args.Int32();  // a negative width means no padding
                Next();
                state = kStateDot;
            }
            else
                state = kStateDot;
        }

        void Dot()
        {
            if (ch == '.')
            {
                Next();
                state = kStatePrecision;
            }
            else
                state = kStateLength;
        }

        void Precision(WindowsArgList& args)
        {
            if (IsDigit(ch))
            {
                if (conv.max < 0)
                    conv.max = 0;
                conv.max = AppendDigit(conv.max, ch);
                Next();
            }
            else if (ch == '*')
            {
                conv.max = args.Int32();
                Next();
                state = kStateLength;
            }
            else
                state = kStateLength;
        }

        void Length()
        {
            switch (ch)
            {
            case 'h': conv.length = kLengthShort; Next(); break;
            case 'l':
                conv.length = kLengthLong;
                Next();
                if (ch == 'l')
                {
                    conv.length = kLengthLongLong;
                    Next();
                }
                break;
            case 'L': conv.length = kLengthLongDouble; Next(); break;
            case 'z': conv.length = kLengthSize; Next(); break;
            case 'j': conv.length = kLengthMax; Next(); break;
            default: break;
            }
            state = kStateConversion;
        }

        void Conversion(Output& out, WindowsArgList& args)
        {
            // "%w" skips the next character, but never the format's end.
            if (Convert(out, args, ch, conv) && *format)
                ++format;
            Next();
            state = kStateDefault;
            conv = ConversionFields();
        }
    };
}

int dopr(char* buffer, size_t maxlen, const char* format, const char* args_in)
{
    Output out = { buffer, maxlen, 0, false };
    WindowsArgList args(args_in);
    Parser parser;
    parser.format = format;
    parser.Next();

    // The walk ends at the format's terminating zero, in whatever state.
    while (parser.ch != 0)
    {
        switch (parser.state)
        {
        case kStateDefault:
            if (parser.ch == '%')
                parser.state = kStateFlags;
            else
                out.Put(parser.ch);
            parser.Next();
            break;
        case kStateFlags: parser.Flags(); break;
        case kStateWidth: parser.Width(args); break;
        case kStateDot: parser.Dot(); break;
        case kStatePrecision: parser.Precision(args); break;
        case kStateLength: parser.Length(); break;
        case kStateConversion: parser.Conversion(out, args); break;
        }
        if (out.overflow)
            return -1;
    }

    if (maxlen != 0)
        buffer[out.currlen < maxlen - 1 ? out.currlen : maxlen - 1] = 0;
    return out.currlen < 0x7FFFFFFF ? static_cast<int>(out.currlen) : -1;
}
