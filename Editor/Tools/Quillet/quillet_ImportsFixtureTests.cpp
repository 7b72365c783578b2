#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_PELoader.h"
#include "Runtime/Testing/ChildProcess.h"

#include <stdio.h>
#include <stdlib.h>

#include <string>

namespace
{
    // ImportsFixture.dll imports all 129 known names and checks them from Windows x64 code. Each
    // export returns 0 or the source line of its first failing check.
    typedef int(__attribute__((ms_abi)) * AreaTest)();

    const char* const kAreas[] = {"Memory", "Sync", "System", "CRuntime", "Math", "Text", "Registers"};

    // Loads the fixture with the real loader and runs every area, printing "<area>=<result>" lines.
    void RunFixtureAreas()
    {
        setenv("IMPORTS_FIXTURE_VALUE", "0123456789", 1);
        const char* error = nullptr;
        PEModule* module = PELoadLibrary(CHARTBAKE_FIXTURE_DIR "/ImportsFixture.dll", nullptr, 0, &error);
        if (!module)
        {
            printf("load failed: %s\n", error ? error : "(no message)");
            return;
        }
        if (const char* fsError = PESetupFS())
        {
            printf("thread setup failed: %s\n", fsError);
            return;
        }
        for (const char* area : kAreas)
        {
            std::string exportName = std::string("ImportsFixture_Test") + area;
            AreaTest test = reinterpret_cast<AreaTest>(PEGetProcAddress(module, exportName.c_str()));
            if (!test)
                printf("%s=missing\n", area);
            else
                printf("%s=%d\n", area, test());
            fflush(stdout);
        }
    }

    // Loads Initterm.dll and prints "<export>=<result>" for its two register checks.
    void RunInittermChecks()
    {
        const char* error = nullptr;
        PEModule* module = PELoadLibrary(CHARTBAKE_FIXTURE_DIR "/Initterm.dll", nullptr, 0, &error);
        if (!module)
        {
            printf("load failed: %s\n", error ? error : "(no message)");
            return;
        }
        PESetupFS();
        for (const char* name : {"Initterm_CheckRegisters", "InittermE_CheckRegisters"})
        {
            AreaTest check = reinterpret_cast<AreaTest>(PEGetProcAddress(module, name));
            printf("%s=%d\n", name, check ? check() : -1);
            fflush(stdout);
        }
    }
}

INTEGRATION_TEST_SUITE(QuilletImportsFixture)
{
    TEST(EveryAreaOfTheAllImportsFixture_PassesFromWindowsCode)
    {
        // In a child: the fixture prints, sets the thread's segment and changes the locale.
        Testing::ChildResult result = Testing::RunInChildProcess(&RunFixtureAreas);
        CHECK(result.exited);
        CHECK_EQUAL(0, result.exitStatus);
        CHECK(result.out.find("Called unresolved function") == std::string::npos);
        CHECK(result.out.find("ImportsFixture: debug line\n") != std::string::npos);
        for (const char* area : kAreas)
        {
            // A failure shows as "<area>=<line in Libraries/ImportsFixture/ImportsFixture<area>.cpp>".
            std::string expected = std::string(area) + "=0\n";
            if (result.out.find(expected) == std::string::npos)
                CHECK_EQUAL(expected, result.out);
        }
    }

    // Start-up functions that spill into their home area must not break the registers the
    // Windows convention keeps: rbx, rbp, rdi, rsi, r12-r15, xmm6-xmm15 (checked in the fixture).
    TEST(InittermStartupFunctions_GetAHomeArea_AndEveryCalleeSavedRegisterSurvives)
    {
        Testing::ChildResult result = Testing::RunInChildProcess(&RunInittermChecks);
        CHECK(result.exited);
        CHECK_EQUAL("Initterm_CheckRegisters=0\nInittermE_CheckRegisters=0\n", result.out);
    }
}
