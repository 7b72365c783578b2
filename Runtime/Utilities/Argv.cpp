#include "Runtime/Utilities/Argv.h"

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Utilities/Word.h"

#include <cstdlib>
#include <cstring>

namespace
{
    struct KnownArguments
    {
        bool isBatchmode = false;
        bool isTestRun = false;
        bool isAutomated = false;
    };

    int argc = 0;
    const char** argv = nullptr;
    KnownArguments knownArgs;
    std::vector<std::string> relaunchArguments;

    bool IsOption(const char* argument, const std::string& name)
    {
        return argument != nullptr && argument[0] == '-' && StrICmp(argument + 1, name.c_str()) == 0;
    }

    bool IsDecimalDigit(char c)
    {
        return c >= '0' && c <= '9';
    }

    // The command-line words for StackTraceLogType, matched case-sensitively.
    bool ParseStackTraceLogType(const std::string& word, StackTraceLogType& type)
    {
        if (word == "None")
            type = kStackTraceLogNone;
        else if (word == "ScriptOnly")
            type = kStackTraceLogScriptOnly;
        else if (word == "Full")
            type = kStackTraceLogFull;
        else
            return false;
        return true;
    }
}

void SetupArgv(int count, const char** vector)
{
    argc = count;
    argv = vector;
    knownArgs.isBatchmode = HasARGV("batchmode");
    knownArgs.isTestRun = HasARGV("runTests") || HasARGV("runEditorTests");
    knownArgs.isAutomated = HasARGV("automated");

    StackTraceLogType type;
    if (HasARGV("stackTraceLogType") && ParseStackTraceLogType(GetFirstValueForARGV("stackTraceLogType"), type))
        SetStackTraceLogType(type);
}

int GetArgc()
{
    return argc;
}

const char** GetArgv()
{
    return argv;
}

bool IsBatchmode()
{
    return knownArgs.isBatchmode;
}

void SetIsBatchmode(bool value)
{
    knownArgs.isBatchmode = value;
}

bool IsTestRun()
{
    return knownArgs.isTestRun;
}

bool IsAutomated()
{
    return knownArgs.isAutomated;
}

bool IsHumanControllingUs()
{
    return !(knownArgs.isBatchmode || knownArgs.isAutomated || knownArgs.isTestRun);
}

bool HasARGV(const std::string& name)
{
    for (int i = 0; i < argc; ++i)
    {
        if (IsOption(argv[i], name))
            return true;
    }
    return false;
}

// A value is a non-empty argument that is not an option: it does not begin with "-", or it is a
// negative number ("-5") or "-" alone.
const char* GetValueFromCommandLine(int index, const char** arguments)
{
    const char* argument = arguments[index];
    if (argument == nullptr || argument[0] == '\0')
        return nullptr;
    if (argument[0] != '-' || IsDecimalDigit(argument[1]) || argument[1] == '\0')
        return argument;
    return nullptr;
}

std::vector<std::string> GetValuesForARGV(const std::string& name)
{
    std::vector<std::string> values;
    int i = 0;
    while (i < argc && !IsOption(argv[i], name))
        ++i;
    for (++i; i < argc; ++i)
    {
        const char* value = GetValueFromCommandLine(i, argv);
        if (value == nullptr)
            break;
        values.emplace_back(value);
    }
    return values;
}

std::string GetFirstValueForARGV(const std::string& name)
{
    const std::vector<std::string> values = GetValuesForARGV(name);
    return values.empty() ? std::string() : values.front();
}

std::vector<std::string> GetAllArguments()
{
    std::vector<std::string> arguments;
    for (int i = 1; i < argc; ++i)
        arguments.emplace_back(argv[i] != nullptr ? argv[i] : "");
    return arguments;
}

void PrintARGV()
{
    for (int i = 0; i < argc; ++i)
    {
        // Only the exact spelling "-password" masks, and only the argument directly after it.
        if (i > 0 && argv[i - 1] != nullptr && strcmp(argv[i - 1], "-password") == 0)
            printf_console("(hidden)\n");
        else
            printf_console("%s\n", argv[i] != nullptr ? argv[i] : "");
    }
}

std::vector<std::string> GetRelaunchApplicationArguments()
{
    return relaunchArguments;
}

void SetRelaunchApplicationArguments(const std::vector<std::string>& arguments)
{
    relaunchArguments = arguments;
}

void CheckBatchModeErrorString(const std::string& error)
{
    if (error.empty())
        return;
    DebugStringToFile(error.c_str(), 0, "Runtime/Utilities/Argv.cpp", 227, kError);
    if (!IsBatchmode())
        return;
    printf_console("\nAborting batchmode due to failure:\n%s\n\n", error.c_str());
    exit(1);
}
