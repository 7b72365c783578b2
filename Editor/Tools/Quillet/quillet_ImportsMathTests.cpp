#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"

#include <float.h>
#include <math.h>
#include <string.h>

#include <bit>
#include <limits>

using namespace QuilletTest;

namespace
{
    double Call(const char* name, double x) { return Import<double, double>(name)(x); }
    int Classify(const char* name, double x) { return Import<int, double>(name)(x); }

    const double kInfinity = std::numeric_limits<double>::infinity();
    const double kQuietNaN = std::numeric_limits<double>::quiet_NaN();
    const double kSignallingNaN = std::numeric_limits<double>::signaling_NaN();

    const uint64_t kGuard = 0x5A5A5A5A12345678ull;

    // Calls a __libm_sse2_* entry as Windows math code does: the argument in xmm0 and nothing
    // else, with the stack aligned but no home area reserved. The four slots above the return
    // address (where a home area would be) hold guards that the entry must not touch.
    double CallRegisterEntry(void* entry, double x, uint64_t guards[4])
    {
        asm volatile(
            "mov %%rsp, %%rbx\n\t"
            "and $-16, %%rsp\n\t"
            "sub $32, %%rsp\n\t"
            "mov 0(%[guards]), %%rax\n\t mov %%rax, 0(%%rsp)\n\t"
            "mov 8(%[guards]), %%rax\n\t mov %%rax, 8(%%rsp)\n\t"
            "mov 16(%[guards]), %%rax\n\t mov %%rax, 16(%%rsp)\n\t"
            "mov 24(%[guards]), %%rax\n\t mov %%rax, 24(%%rsp)\n\t"
            "call *%[entry]\n\t"
            "mov 0(%%rsp), %%rax\n\t mov %%rax, 0(%[guards])\n\t"
            "mov 8(%%rsp), %%rax\n\t mov %%rax, 8(%[guards])\n\t"
            "mov 16(%%rsp), %%rax\n\t mov %%rax, 16(%[guards])\n\t"
            "mov 24(%%rsp), %%rax\n\t mov %%rax, 24(%[guards])\n\t"
            "mov %%rbx, %%rsp"
            : "+Yz"(x)
            : [entry] "r"(entry), [guards] "r"(guards)
            : "rax", "rbx", "rcx", "rdx", "r8", "r9", "r10", "r11", "xmm1", "xmm2", "xmm3", "xmm4", "xmm5", "memory", "cc");
        return x;
    }
}

UNIT_TEST_SUITE(QuilletImportsMath)
{
    TEST(Fpclass_ClassifiesMagnitudeAndSign)
    {
        CHECK_EQUAL(0x0020, Classify("_fpclass", -0.0));
        CHECK_EQUAL(0x0040, Classify("_fpclass", 0.0));
        CHECK_EQUAL(0x0100, Classify("_fpclass", 1.0));
        CHECK_EQUAL(0x0008, Classify("_fpclass", -DBL_MIN));
        CHECK_EQUAL(0x0080, Classify("_fpclass", 5e-324));
        CHECK_EQUAL(0x0010, Classify("_fpclass", -5e-324));
        CHECK_EQUAL(0x0200, Classify("_fpclass", kInfinity));
        CHECK_EQUAL(0x0004, Classify("_fpclass", -kInfinity));
        CHECK_EQUAL(0x0002, Classify("_fpclass", kQuietNaN));
        CHECK_EQUAL(0x0002, Classify("_fpclass", -kSignallingNaN));
    }

    TEST(FiniteAndIsnan)
    {
        CHECK_EQUAL(1, Classify("_finite", DBL_MAX));
        CHECK_EQUAL(1, Classify("_finite", -DBL_MAX));
        CHECK_EQUAL(0, Classify("_finite", kInfinity));
        CHECK_EQUAL(0, Classify("_finite", kQuietNaN));
        CHECK_EQUAL(1, Classify("_isnan", kQuietNaN));
        CHECK_EQUAL(1, Classify("_isnan", kSignallingNaN));
        CHECK_EQUAL(0, Classify("_isnan", kInfinity));
    }

    TEST(Fabs_ClearsTheSignBitOnly)
    {
        CHECK_EQUAL(0ull, std::bit_cast<uint64_t>(Call("fabs", -0.0)));
        CHECK_EQUAL(2.5, Call("fabs", -2.5));
        CHECK(isnan(Call("fabs", -kQuietNaN)));
        CHECK(!signbit(Call("fabs", -kQuietNaN)));
    }

    TEST(TwoArgumentMath_KeepsTheArgumentOrder)
    {
        CHECK_EQUAL(atan2(1.0, -1.0), (Import<double, double, double>("atan2")(1.0, -1.0)));
        CHECK_EQUAL(8.0, (Import<double, double, double>("pow")(2.0, 3.0)));
        CHECK_EQUAL(9.0f, (Import<float, float, float>("powf")(3.0f, 2.0f)));
        CHECK_EQUAL(1.5, (Import<double, double, double>("fmod")(7.5, 3.0)));

        double whole = 0;
        CHECK_EQUAL(-0.25, (Import<double, double, double*>("modf")(-3.25, &whole)));
        CHECK_EQUAL(-3.0, whole);
        int exponent = 0;
        CHECK_EQUAL(0.75, (Import<double, double, int*>("frexp")(6.0, &exponent)));
        CHECK_EQUAL(3, exponent);
    }

    TEST(LibmSse2Entries_TakeAndReturnXmm0WithoutAHomeArea)
    {
        struct Entry { const char* name; double (*reference)(double); double x; };
        const Entry entries[] = {{"__libm_sse2_sin", &sin, 0.75}, {"__libm_sse2_cos", &cos, 0.75},
                                 {"__libm_sse2_asin", &asin, 0.5}, {"__libm_sse2_acos", &acos, 0.5},
                                 {"__libm_sse2_log", &log, 10.0}};
        for (const Entry& entry : entries)
        {
            void* function = FindImport(entry.name);
            CHECK(function != nullptr);
            uint64_t guards[4] = {kGuard, kGuard + 1, kGuard + 2, kGuard + 3};
            CHECK_EQUAL(entry.reference(entry.x), CallRegisterEntry(function, entry.x, guards));
            CHECK_EQUAL(kGuard, guards[0]);
            CHECK_EQUAL(kGuard + 3, guards[3]);
            // Also callable as an ordinary Windows function of one double.
            CHECK_EQUAL(entry.reference(entry.x), Call(entry.name, entry.x));
        }
    }
}
