#pragma once

#include <functional>
#include <string>
#include <vector>

namespace Testing
{
    // How a child process ended and what it wrote.
    struct ChildResult
    {
        bool exited = false;   // ended through exit(); false when a signal ended it
        int exitStatus = -1;   // exit status when `exited`
        int termSignal = 0;    // the ending signal when not `exited`
        std::string out;       // everything written to standard output
        std::string err;       // everything written to standard error
    };

    // Runs `body` in a forked copy of this process with its standard output and error captured.
    // A body that returns ends the child with status 0; one that exits or crashes ends it its own way;
    // one that throws ends it with status 127 and a line on standard error.
    ChildResult RunInChildProcess(const std::function<void()>& body);

    // Runs a program (argv[0] is its path) in `workDir`, with `extraEnv` ("NAME=value") added to
    // this process's environment, and captures its output. Standard input is empty.
    ChildResult RunProgram(const std::vector<std::string>& argv, const std::string& workDir,
                           const std::vector<std::string>& extraEnv = {});
}
