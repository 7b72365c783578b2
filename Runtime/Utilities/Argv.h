#pragma once
// The process-wide store of the command line. Options are written "-name" and looked up by
// their name without the dash, ignoring ASCII case.

#include <string>
#include <vector>

void SetupArgv(int argc, const char** argv);
int GetArgc();
const char** GetArgv();

bool IsBatchmode();
void SetIsBatchmode(bool value);
bool IsTestRun();
bool IsAutomated();
bool IsHumanControllingUs();

bool HasARGV(const std::string& name);
std::vector<std::string> GetValuesForARGV(const std::string& name);
std::string GetFirstValueForARGV(const std::string& name);
// The argument at `index` if it is a value (not an option), else null.
const char* GetValueFromCommandLine(int index, const char** argv);
std::vector<std::string> GetAllArguments();

// Prints every argument on its own line; the one after an exact "-password" shows as "(hidden)".
void PrintARGV();

std::vector<std::string> GetRelaunchApplicationArguments();
void SetRelaunchApplicationArguments(const std::vector<std::string>& arguments);

// Logs a non-empty error; in batch mode then prints the abort text and exits with status 1.
void CheckBatchModeErrorString(const std::string& error);
