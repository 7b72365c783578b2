// The unit-test executable: runs every registered test of this project.
//     UnitTests [-category <prefix>] [-filter <pattern> ...] ...
// -filter may be given more than once and may be followed by several patterns. The exit status is
// the number of failed tests, capped at 255 so that a large count can never wrap to success.

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Testing/Testing.h"
#include "Runtime/Utilities/Argv.h"
#include "Runtime/Utilities/Word.h"

#include <algorithm>
#include <string>
#include <vector>

namespace
{
    // The values after every occurrence of "-name" (the argument store looks at the first only).
    std::vector<std::string> ValuesOfRepeatedOption(const char* name)
    {
        const std::string option = std::string("-") + name;
        std::vector<std::string> values;
        const int argc = GetArgc();
        const char** argv = GetArgv();
        for (int i = 1; i < argc; ++i)
        {
            if (StrICmp(argv[i], option.c_str()) != 0)
                continue;
            while (i + 1 < argc && GetValueFromCommandLine(i + 1, argv) != nullptr)
                values.push_back(argv[++i]);
        }
        return values;
    }
}

int main(int argc, char** argv)
{
    SetupArgv(argc, const_cast<const char**>(argv));
    InitializeLoggingFromEnvironment();
    const std::string category = GetFirstValueForARGV("category");
    const int failedTests = Testing::RunNativeTests(category, ValuesOfRepeatedOption("filter"));
    return std::min(failedTests, 255);
}
