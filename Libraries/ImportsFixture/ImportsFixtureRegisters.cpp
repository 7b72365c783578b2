// The Windows x64 register contract at the boundary to the host: host functions that call into the
// host C library must hand back rsi, rdi and xmm6 to xmm15 unchanged, and the __libm_sse2_*
// entries take their argument in xmm0 alone and return in xmm0.
#include "ImportsFixture.h"

namespace
{
    // Everything one probed call needs, at fixed offsets for the assembly below.
    struct RegisterProbe
    {
        uint64_t args[4];         // 0x00: rcx, rdx, r8, r9
        uint64_t rsi, rdi;        // 0x20: patterns loaded before the call
        double x;                 // 0x30: xmm0
        void* function;           // 0x38
        uint64_t xmm[10][2];      // 0x40: patterns for xmm6..xmm15
        uint64_t outRax;          // 0xE0
        double outXmm0;           // 0xE8
        uint64_t outRsi, outRdi;  // 0xF0
        uint64_t outXmm[10][2];   // 0x100: xmm6..xmm15 after the call
    };
    static_assert(offsetof(RegisterProbe, xmm) == 0x40 && offsetof(RegisterProbe, outRax) == 0xE0, "layout");
    static_assert(offsetof(RegisterProbe, outXmm) == 0x100, "layout");

    // Loads the patterns into rsi, rdi and xmm6..xmm15, calls the function with an aligned stack
    // and a home area, and records the registers afterwards.
    void CallProbed(RegisterProbe* probe)
    {
        asm volatile(
            "movq %%rsp, %%rbx\n\t"
            "andq $-16, %%rsp\n\t"
            "subq $32, %%rsp\n\t"
            "movq %[probe], %%r12\n\t"
            "movdqu 0x40(%%r12), %%xmm6\n\t"
            "movdqu 0x50(%%r12), %%xmm7\n\t"
            "movdqu 0x60(%%r12), %%xmm8\n\t"
            "movdqu 0x70(%%r12), %%xmm9\n\t"
            "movdqu 0x80(%%r12), %%xmm10\n\t"
            "movdqu 0x90(%%r12), %%xmm11\n\t"
            "movdqu 0xA0(%%r12), %%xmm12\n\t"
            "movdqu 0xB0(%%r12), %%xmm13\n\t"
            "movdqu 0xC0(%%r12), %%xmm14\n\t"
            "movdqu 0xD0(%%r12), %%xmm15\n\t"
            "movq 0x20(%%r12), %%rsi\n\t"
            "movq 0x28(%%r12), %%rdi\n\t"
            "movq 0x00(%%r12), %%rcx\n\t"
            "movq 0x08(%%r12), %%rdx\n\t"
            "movq 0x10(%%r12), %%r8\n\t"
            "movq 0x18(%%r12), %%r9\n\t"
            "movsd 0x30(%%r12), %%xmm0\n\t"
            "callq *0x38(%%r12)\n\t"
            "movq %%rax, 0xE0(%%r12)\n\t"
            "movsd %%xmm0, 0xE8(%%r12)\n\t"
            "movq %%rsi, 0xF0(%%r12)\n\t"
            "movq %%rdi, 0xF8(%%r12)\n\t"
            "movdqu %%xmm6, 0x100(%%r12)\n\t"
            "movdqu %%xmm7, 0x110(%%r12)\n\t"
            "movdqu %%xmm8, 0x120(%%r12)\n\t"
            "movdqu %%xmm9, 0x130(%%r12)\n\t"
            "movdqu %%xmm10, 0x140(%%r12)\n\t"
            "movdqu %%xmm11, 0x150(%%r12)\n\t"
            "movdqu %%xmm12, 0x160(%%r12)\n\t"
            "movdqu %%xmm13, 0x170(%%r12)\n\t"
            "movdqu %%xmm14, 0x180(%%r12)\n\t"
            "movdqu %%xmm15, 0x190(%%r12)\n\t"
            "movq %%rbx, %%rsp"
            :
            : [probe] "r"(probe)
            : "rax", "rbx", "rcx", "rdx", "rsi", "rdi", "r8", "r9", "r10", "r11", "r12",
              "xmm0", "xmm1", "xmm2", "xmm3", "xmm4", "xmm5", "xmm6", "xmm7", "xmm8", "xmm9",
              "xmm10", "xmm11", "xmm12", "xmm13", "xmm14", "xmm15", "memory", "cc");
    }

    void Prepare(RegisterProbe& probe, void* function, uint64_t a, uint64_t b, uint64_t c, uint64_t d, double x)
    {
        probe.args[0] = a;
        probe.args[1] = b;
        probe.args[2] = c;
        probe.args[3] = d;
        probe.rsi = 0x5151515151515151ull;
        probe.rdi = 0xD1D1D1D1D1D1D1D1ull;
        probe.x = x;
        probe.function = function;
        for (int i = 0; i < 10; ++i)
        {
            probe.xmm[i][0] = 0x0123456789ABCDEFull * (i + 3);
            probe.xmm[i][1] = ~probe.xmm[i][0] ^ (uint64_t(i) << 40);
        }
    }

    bool Preserved(const RegisterProbe& probe)
    {
        return probe.outRsi == probe.rsi && probe.outRdi == probe.rdi &&
               Fixture::SameBytes(probe.outXmm, probe.xmm, sizeof probe.xmm);
    }

    uint64_t Arg(const void* pointer) { return reinterpret_cast<uint64_t>(pointer); }

    int CheckCallsIntoTheCLibrary()
    {
        RegisterProbe probe;
        static char source[8192];
        static char target[8192];
        Fixture::Fill(source, 'k', sizeof source);

        // Large copies and fills use the host library's widest vector registers.
        Prepare(probe, (void*)&memcpy, Arg(target), Arg(source), sizeof target, 0, 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(probe.outRax == Arg(target) && target[8191] == 'k' && Preserved(probe));

        Prepare(probe, (void*)&memset, Arg(target), 'm', sizeof target, 0, 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(target[4000] == 'm' && Preserved(probe));

        Prepare(probe, (void*)&sin, 0, 0, 0, 0, 0.5);
        CallProbed(&probe);
        FIXTURE_CHECK(probe.outXmm0 > 0.4794255386 && probe.outXmm0 < 0.4794255387 && Preserved(probe));

        Prepare(probe, (void*)&atof, Arg("6.25e2"), 0, 0, 0, 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(probe.outXmm0 == 625.0 && Preserved(probe));

        Prepare(probe, (void*)&getenv, Arg("IMPORTS_FIXTURE_VALUE"), 0, 0, 0, 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(probe.outRax != 0 && Preserved(probe));

        Prepare(probe, (void*)&malloc, 100, 0, 0, 0, 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(probe.outRax != 0 && Preserved(probe));
        Prepare(probe, (void*)&free, probe.outRax, 0, 0, 0, 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(Preserved(probe));
        return 0;
    }

    int CheckFormatter()
    {
        RegisterProbe probe;
        char buffer[64];
        double values[2] = {1.5, -2.25};  // a Windows argument list of two double slots
        Prepare(probe, (void*)&_vsnprintf, Arg(buffer), sizeof buffer, Arg("%.2f %.3f"), Arg(values), 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(probe.outRax == 11 && Fixture::SameText(buffer, "1.50 -2.250") && Preserved(probe));

        Prepare(probe, (void*)&sprintf_s, Arg(buffer), sizeof buffer, Arg("<%d>"), 42, 0.0);
        CallProbed(&probe);
        FIXTURE_CHECK(probe.outRax == 4 && Fixture::SameText(buffer, "<42>") && Preserved(probe));
        return 0;
    }

    // Only xmm0 carries the argument: the integer registers hold garbage.
    int CheckLibmSse2Entries()
    {
        struct Entry { void* function; double x, low, high; };
        const Entry entries[] = {
            {(void*)&__libm_sse2_sin, 0.5, 0.4794255386, 0.4794255387},
            {(void*)&__libm_sse2_cos, 0.5, 0.8775825618, 0.8775825619},
            {(void*)&__libm_sse2_asin, 0.5, 0.5235987755, 0.5235987756},
            {(void*)&__libm_sse2_acos, 0.5, 1.0471975511, 1.0471975512},
            {(void*)&__libm_sse2_log, 10.0, 2.3025850929, 2.3025850930},
        };
        for (const Entry& entry : entries)
        {
            RegisterProbe probe;
            Prepare(probe, entry.function, ~0ull, ~0ull, ~0ull, ~0ull, entry.x);
            CallProbed(&probe);
            FIXTURE_CHECK(probe.outXmm0 > entry.low && probe.outXmm0 < entry.high && Preserved(probe));
        }
        return 0;
    }
}

FIXTURE_EXPORT int ImportsFixture_TestRegisters()
{
    if (int line = CheckCallsIntoTheCLibrary())
        return line;
    if (int line = CheckFormatter())
        return line;
    return CheckLibmSse2Entries();
}
