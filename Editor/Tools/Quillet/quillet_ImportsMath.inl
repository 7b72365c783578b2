// Known imports, math area: the host math library behind the Windows names, the bit-level
// classification functions, and the __libm_sse2_* register entry points. Included by
// quillet_KnownImports.cpp only.

namespace
{
    const uint64_t kSignBit = 0x8000000000000000ull;
    const uint64_t kLargestFinite = 0x7FEFFFFFFFFFFFFFull;
    const uint64_t kSmallestNormal = 0x0010000000000000ull;
    const uint64_t kPositiveInfinity = 0x7FF0000000000000ull;

    inline uint64_t BitsOf(double x) { return std::bit_cast<uint64_t>(x); }

    QUILLET_WINAPI double fabs_impl(double x) { return std::bit_cast<double>(BitsOf(x) & ~kSignBit); }
    QUILLET_WINAPI int _finite_impl(double x) { return (BitsOf(x) & ~kSignBit) <= kLargestFinite; }
    QUILLET_WINAPI int _isnan_impl(double x) { return (BitsOf(x) & ~kSignBit) > kPositiveInfinity; }

    // Windows _FPCLASS_* codes; a signalling NaN is reported as a quiet one.
    QUILLET_WINAPI int _fpclass_impl(double x)
    {
        const uint64_t magnitude = BitsOf(x) & ~kSignBit;
        const bool negative = (BitsOf(x) & kSignBit) != 0;
        if (magnitude > kPositiveInfinity)
            return 0x0002;
        if (magnitude > kLargestFinite)
            return negative ? 0x0004 : 0x0200;
        if (magnitude >= kSmallestNormal)
            return negative ? 0x0008 : 0x0100;
        if (magnitude == 0)
            return negative ? 0x0020 : 0x0040;
        return negative ? 0x0010 : 0x0080;
    }

    QUILLET_WINAPI double modf_impl(double x, double* y) { return modf(x, y); }
    QUILLET_WINAPI double ceil_impl(double x) { return ceil(x); }
    QUILLET_WINAPI double floor_impl(double x) { return floor(x); }
    QUILLET_WINAPI float floorf_impl(float x) { return floorf(x); }
    QUILLET_WINAPI double sqrt_impl(double x) { return sqrt(x); }
    QUILLET_WINAPI float sqrtf_impl(float x) { return sqrtf(x); }
    QUILLET_WINAPI double tan_impl(double x) { return tan(x); }
    QUILLET_WINAPI double sin_impl(double x) { return sin(x); }
    QUILLET_WINAPI double cos_impl(double x) { return cos(x); }
    QUILLET_WINAPI double acos_impl(double x) { return acos(x); }
    QUILLET_WINAPI double asin_impl(double x) { return asin(x); }
    QUILLET_WINAPI double atan_impl(double x) { return atan(x); }
    QUILLET_WINAPI double atan2_impl(double y, double x) { return atan2(y, x); }
    QUILLET_WINAPI double cosh_impl(double x) { return cosh(x); }
    QUILLET_WINAPI double sinh_impl(double x) { return sinh(x); }
    QUILLET_WINAPI double tanh_impl(double x) { return tanh(x); }
    QUILLET_WINAPI double exp_impl(double x) { return exp(x); }
    QUILLET_WINAPI double log_impl(double x) { return log(x); }
    QUILLET_WINAPI double frexp_impl(double x, int* n) { return frexp(x, n); }
    QUILLET_WINAPI double pow_impl(double x, double y) { return pow(x, y); }
    QUILLET_WINAPI float powf_impl(float x, float y) { return powf(x, y); }
    QUILLET_WINAPI double fmod_impl(double x, double y) { return fmod(x, y); }

    // The __libm_sse2_* entry points declare no parameters: their double comes in xmm0 and the
    // result goes back in xmm0. That is exactly where the Windows convention passes and returns
    // one double, so each entry calls the matching host function above. It reserves the 32-byte
    // home area itself, because its callers need not provide one for these entries, and keeps the
    // stack 16-byte aligned for the call (8 on entry + 40 = 48).
#define QUILLET_LIBM_SSE2_ENTRY(entry, body)                                                    \
    __attribute__((naked)) QUILLET_WINAPI void entry()                                          \
    {                                                                                           \
        asm("subq $40, %rsp\n\t"                                                                \
            "call " #body "\n\t"                                                                \
            "addq $40, %rsp\n\t"                                                                \
            "ret");                                                                             \
    }

    // Asm labels give the host functions names that the entries can call from assembly.
    __attribute__((used)) QUILLET_WINAPI double LibmSse2Acos(double x) asm("quillet_libm_sse2_acos");
    __attribute__((used)) QUILLET_WINAPI double LibmSse2Asin(double x) asm("quillet_libm_sse2_asin");
    __attribute__((used)) QUILLET_WINAPI double LibmSse2Cos(double x) asm("quillet_libm_sse2_cos");
    __attribute__((used)) QUILLET_WINAPI double LibmSse2Sin(double x) asm("quillet_libm_sse2_sin");
    __attribute__((used)) QUILLET_WINAPI double LibmSse2Log(double x) asm("quillet_libm_sse2_log");
    QUILLET_WINAPI double LibmSse2Acos(double x) { return acos(x); }
    QUILLET_WINAPI double LibmSse2Asin(double x) { return asin(x); }
    QUILLET_WINAPI double LibmSse2Cos(double x) { return cos(x); }
    QUILLET_WINAPI double LibmSse2Sin(double x) { return sin(x); }
    QUILLET_WINAPI double LibmSse2Log(double x) { return log(x); }

    QUILLET_LIBM_SSE2_ENTRY(__libm_sse2_acos_impl, quillet_libm_sse2_acos)
    QUILLET_LIBM_SSE2_ENTRY(__libm_sse2_asin_impl, quillet_libm_sse2_asin)
    QUILLET_LIBM_SSE2_ENTRY(__libm_sse2_cos_impl, quillet_libm_sse2_cos)
    QUILLET_LIBM_SSE2_ENTRY(__libm_sse2_sin_impl, quillet_libm_sse2_sin)
    QUILLET_LIBM_SSE2_ENTRY(__libm_sse2_log_impl, quillet_libm_sse2_log)

#undef QUILLET_LIBM_SSE2_ENTRY
}
