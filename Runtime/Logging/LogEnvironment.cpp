// The environment variables that name the console log file and the cleaned log file.

#include "Runtime/Logging/LogAssert.h"

#include <cstdlib>

std::string GetStringFromEnv(const char* name)
{
    const char* value = getenv(name);
    return value != nullptr ? std::string(value) : std::string();
}

std::string GetCustomLogFile()
{
    return GetStringFromEnv("HALVOR_LOG_FILE");
}

std::string GetCleanedLogFile()
{
    return GetStringFromEnv("HALVOR_CLEANED_LOG_FILE");
}

void InitializeLoggingFromEnvironment()
{
    const std::string consoleFile = GetCustomLogFile();
    if (!consoleFile.empty())
        LogOutputToSpecificFile(consoleFile.c_str());

    const std::string cleanedFile = GetCleanedLogFile();
    if (!cleanedFile.empty())
    {
        FILE* file = fopen(cleanedFile.c_str(), "w");
        if (file != nullptr)
            InitializeCleanedLogFile(file);
        else
            printf_console("Could not open the cleaned log file '%s'\n", cleanedFile.c_str());
    }
}
