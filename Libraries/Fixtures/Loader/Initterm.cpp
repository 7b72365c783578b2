// Start-up functions that use the 32-byte home area their caller must reserve, as compiled
// Windows code may at any time (spilling its register arguments there). Calling them through the
// imported _initterm and _initterm_e, with every callee-saved register holding a pattern, shows
// whether the host calls them with the Windows x64 convention: without a home area they overwrite
// the host function's own frame, and the registers it saved for this code come back wrong.
#include "WinImports.h"

extern "C" volatile int32_t g_InittermCalls = 0;

// Writes garbage over its whole home area and into every volatile register, counts the call.
#define SPILL_HOME_AREA                         \
    "movabsq $0x0BADC0DE0BADC0DE, %rax\n\t"     \
    "movq %rax, 8(%rsp)\n\t"                    \
    "movq %rax, 16(%rsp)\n\t"                   \
    "movq %rax, 24(%rsp)\n\t"                   \
    "movq %rax, 32(%rsp)\n\t"                   \
    "movq %rax, %rcx\n\t"                       \
    "movq %rax, %rdx\n\t"                       \
    "movq %rax, %r8\n\t"                        \
    "movq %rax, %r9\n\t"                        \
    "movq %rax, %r10\n\t"                       \
    "movq %rax, %r11\n\t"                       \
    "movq %rax, %xmm0\n\t"                      \
    "movq %rax, %xmm1\n\t"                      \
    "movq %rax, %xmm2\n\t"                      \
    "movq %rax, %xmm3\n\t"                      \
    "movq %rax, %xmm4\n\t"                      \
    "movq %rax, %xmm5\n\t"                      \
    "lock incl g_InittermCalls(%rip)\n\t"

extern "C" __attribute__((naked)) void SpillingConstructor()
{
    __asm__(SPILL_HOME_AREA "ret");
}

extern "C" __attribute__((naked)) int SpillingInitialiser()
{
    __asm__(SPILL_HOME_AREA "movl $7, %eax\n\tret");
}

namespace
{
    // Patterns loaded before the call and what the registers held after it, at fixed offsets for
    // the assembly below.
    struct Probe
    {
        uint64_t function;       // 0x00 the import to call
        uint64_t begin, end;     // 0x08, 0x10 its two arguments
        uint64_t savedRsp;       // 0x18
        uint64_t gpr[8];         // 0x20 rbx, rbp, rdi, rsi, r12, r13, r14, r15
        uint64_t xmm[10][2];     // 0x60 xmm6..xmm15
        uint64_t outGpr[8];      // 0x100
        uint64_t outXmm[10][2];  // 0x140
        uint64_t outRax;         // 0x1E0
    };
    static_assert(__builtin_offsetof(Probe, xmm) == 0x60 && __builtin_offsetof(Probe, outGpr) == 0x100, "layout");
    static_assert(__builtin_offsetof(Probe, outXmm) == 0x140 && __builtin_offsetof(Probe, outRax) == 0x1E0, "layout");

    // Calls probe->function(begin, end) with an aligned stack, a home area, and every callee-saved
    // register (rbp included) holding its pattern; records them all afterwards.
    void CallProbed(Probe* probe)
    {
        __asm__ volatile(
            "movq %[probe], %%rax\n\t"
            "movq %%rsp, 0x18(%%rax)\n\t"
            "andq $-16, %%rsp\n\t"
            "pushq %%rax\n\t"
            "pushq %%rbp\n\t"
            "subq $32, %%rsp\n\t"
            "movq 0x20(%%rax), %%rbx\n\t"
            "movq 0x28(%%rax), %%rbp\n\t"
            "movq 0x30(%%rax), %%rdi\n\t"
            "movq 0x38(%%rax), %%rsi\n\t"
            "movq 0x40(%%rax), %%r12\n\t"
            "movq 0x48(%%rax), %%r13\n\t"
            "movq 0x50(%%rax), %%r14\n\t"
            "movq 0x58(%%rax), %%r15\n\t"
            "movdqu 0x60(%%rax), %%xmm6\n\t"
            "movdqu 0x70(%%rax), %%xmm7\n\t"
            "movdqu 0x80(%%rax), %%xmm8\n\t"
            "movdqu 0x90(%%rax), %%xmm9\n\t"
            "movdqu 0xA0(%%rax), %%xmm10\n\t"
            "movdqu 0xB0(%%rax), %%xmm11\n\t"
            "movdqu 0xC0(%%rax), %%xmm12\n\t"
            "movdqu 0xD0(%%rax), %%xmm13\n\t"
            "movdqu 0xE0(%%rax), %%xmm14\n\t"
            "movdqu 0xF0(%%rax), %%xmm15\n\t"
            "movq 0x08(%%rax), %%rcx\n\t"
            "movq 0x10(%%rax), %%rdx\n\t"
            "callq *0x00(%%rax)\n\t"
            "addq $32, %%rsp\n\t"
            "movq %%rax, %%r10\n\t"
            "movq 8(%%rsp), %%rax\n\t"
            "movq %%r10, 0x1E0(%%rax)\n\t"
            "movq %%rbx, 0x100(%%rax)\n\t"
            "movq %%rbp, 0x108(%%rax)\n\t"
            "movq %%rdi, 0x110(%%rax)\n\t"
            "movq %%rsi, 0x118(%%rax)\n\t"
            "movq %%r12, 0x120(%%rax)\n\t"
            "movq %%r13, 0x128(%%rax)\n\t"
            "movq %%r14, 0x130(%%rax)\n\t"
            "movq %%r15, 0x138(%%rax)\n\t"
            "movdqu %%xmm6, 0x140(%%rax)\n\t"
            "movdqu %%xmm7, 0x150(%%rax)\n\t"
            "movdqu %%xmm8, 0x160(%%rax)\n\t"
            "movdqu %%xmm9, 0x170(%%rax)\n\t"
            "movdqu %%xmm10, 0x180(%%rax)\n\t"
            "movdqu %%xmm11, 0x190(%%rax)\n\t"
            "movdqu %%xmm12, 0x1A0(%%rax)\n\t"
            "movdqu %%xmm13, 0x1B0(%%rax)\n\t"
            "movdqu %%xmm14, 0x1C0(%%rax)\n\t"
            "movdqu %%xmm15, 0x1D0(%%rax)\n\t"
            "popq %%rbp\n\t"
            "movq 0x18(%%rax), %%rsp"
            :
            : [probe] "r"(probe)
            : "rax", "rbx", "rcx", "rdx", "rsi", "rdi", "r8", "r9", "r10", "r11", "r12", "r13", "r14", "r15",
              "xmm0", "xmm1", "xmm2", "xmm3", "xmm4", "xmm5", "xmm6", "xmm7", "xmm8", "xmm9", "xmm10", "xmm11",
              "xmm12", "xmm13", "xmm14", "xmm15", "memory", "cc");
    }

    void Prepare(Probe& probe, uint64_t function, uint64_t begin, uint64_t end)
    {
        probe.function = function;
        probe.begin = begin;
        probe.end = end;
        for (int i = 0; i < 8; ++i)
            probe.gpr[i] = 0x1111111111111111ull * (i + 1) ^ 0x0F0F000000000000ull;
        for (int i = 0; i < 10; ++i)
        {
            probe.xmm[i][0] = 0x0123456789ABCDEFull * (i + 3);
            probe.xmm[i][1] = ~probe.xmm[i][0] ^ (uint64_t(i) << 40);
        }
    }

    // 0 when every callee-saved register came back; else 1 + the index of the first that did
    // not (rbx, rbp, rdi, rsi, r12..r15 are 1..8; xmm6..xmm15 are 9..18).
    int FirstChangedRegister(const Probe& probe)
    {
        for (int i = 0; i < 8; ++i)
            if (probe.outGpr[i] != probe.gpr[i])
                return 1 + i;
        for (int i = 0; i < 10; ++i)
            if (probe.outXmm[i][0] != probe.xmm[i][0] || probe.outXmm[i][1] != probe.xmm[i][1])
                return 9 + i;
        return 0;
    }

    uint64_t Address(const void* p) { return reinterpret_cast<uint64_t>(p); }

    _PVFV s_Constructors[] = {&SpillingConstructor, nullptr, &SpillingConstructor};
    _PIFV s_Initialisers[] = {&SpillingInitialiser, &SpillingInitialiser};
}

namespace
{
    // Calls `function` over [begin, end) with every callee-saved register holding a pattern.
    // 0 when the start-up functions ran twice, the result (when `result` is not negative) matched
    // and every callee-saved register survived; else 100 + calls for a wrong count, 200 + result
    // for a wrong result, or the register code of FirstChangedRegister.
    int32_t CheckCall(const void* function, const void* begin, const void* end, int32_t result)
    {
        Probe probe;
        g_InittermCalls = 0;
        Prepare(probe, Address(function), Address(begin), Address(end));
        CallProbed(&probe);
        if (g_InittermCalls != 2)
            return 100 + g_InittermCalls;
        if (result >= 0 && static_cast<int32_t>(probe.outRax) != result)
            return 200 + static_cast<int32_t>(probe.outRax);
        return FirstChangedRegister(probe);
    }
}

extern "C" __declspec(dllexport) int32_t Initterm_CheckRegisters()
{
    return CheckCall(reinterpret_cast<const void*>(&_initterm), s_Constructors, s_Constructors + 3, -1);
}

extern "C" __declspec(dllexport) int32_t InittermE_CheckRegisters()
{
    return CheckCall(reinterpret_cast<const void*>(&_initterm_e), s_Initialisers, s_Initialisers + 2, 7);
}

extern "C" BOOL DllMain(HMODULE, DWORD, void*)
{
    return 1;
}
