#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/Testing.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>

UNIT_TEST_SUITE(ChildProcess)
{
    TEST(Body_OutputIsCapturedPerStream_AndHowTheChildEndedIsReported)
    {
        const Testing::ChildResult returned = Testing::RunInChildProcess([] {
            printf("to out");
            fprintf(stderr, "to err");
        });
        CHECK(returned.exited);
        CHECK_EQUAL(0, returned.exitStatus);
        CHECK_EQUAL("to out", returned.out);
        CHECK_EQUAL("to err", returned.err);

        const Testing::ChildResult exited = Testing::RunInChildProcess([] { exit(3); });
        CHECK(exited.exited);
        CHECK_EQUAL(3, exited.exitStatus);

        const Testing::ChildResult threw = Testing::RunInChildProcess([] { throw 1; });
        CHECK(threw.exited);
        CHECK_EQUAL(127, threw.exitStatus);
        CHECK_EQUAL("uncaught exception in child process\n", threw.err);

        const Testing::ChildResult killed = Testing::RunInChildProcess([] { raise(SIGSEGV); });
        CHECK(!killed.exited);
        CHECK_EQUAL(SIGSEGV, killed.termSignal);
    }

    TEST(Program_RunsInItsDirectory_WithTheExtraEnvironment)
    {
        const Testing::ChildResult run =
            Testing::RunProgram({"/bin/sh", "-c", "pwd; echo \"$CHILD_PROCESS_PROBE\"; exit 4"}, "/",
                                {"CHILD_PROCESS_PROBE=seen"});
        CHECK(run.exited);
        CHECK_EQUAL(4, run.exitStatus);
        CHECK_EQUAL("/\nseen\n", run.out);
    }

    TEST(Program_ThatCannotStart_EndsWith127AndSaysWhy)
    {
        const Testing::ChildResult missing = Testing::RunProgram({"/nonexistent/program"}, "");
        CHECK(missing.exited);
        CHECK_EQUAL(127, missing.exitStatus);
        CHECK(missing.err.find("cannot run /nonexistent/program") == 0);

        const Testing::ChildResult badDir = Testing::RunProgram({"/bin/true"}, "/nonexistent/dir");
        CHECK_EQUAL(127, badDir.exitStatus);
        CHECK(badDir.err.find("cannot enter /nonexistent/dir") == 0);

        const Testing::ChildResult empty = Testing::RunProgram({}, "");
        CHECK(!empty.exited);
        CHECK(empty.err.find("empty command line") != std::string::npos);
    }
}
