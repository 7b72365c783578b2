#include "Runtime/Testing/ChildProcess.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/wait.h>
#include <unistd.h>

namespace Testing
{
namespace
{
    struct Pipes
    {
        int out[2] = {-1, -1};
        int err[2] = {-1, -1};
    };

    void CloseIfOpen(int& fd)
    {
        if (fd >= 0)
            close(fd);
        fd = -1;
    }

    void ClosePipes(Pipes& p)
    {
        for (int* fd : {&p.out[0], &p.out[1], &p.err[0], &p.err[1]})
            CloseIfOpen(*fd);
    }

    bool OpenPipes(Pipes& p)
    {
        return pipe2(p.out, O_CLOEXEC) == 0 && pipe2(p.err, O_CLOEXEC) == 0;
    }

    // In the child: route standard output and error into the pipes, standard input from nothing.
    void RedirectInChild(const Pipes& p)
    {
        dup2(p.out[1], STDOUT_FILENO);
        dup2(p.err[1], STDERR_FILENO);
        int devNull = open("/dev/null", O_RDONLY);
        if (devNull >= 0)
            dup2(devNull, STDIN_FILENO);
    }

    // Reads both pipes until the child closes them, so that neither can fill up and stall it.
    void DrainPipes(Pipes& p, ChildResult& result)
    {
        CloseIfOpen(p.out[1]);
        CloseIfOpen(p.err[1]);
        pollfd fds[2] = {{p.out[0], POLLIN, 0}, {p.err[0], POLLIN, 0}};
        std::string* sinks[2] = {&result.out, &result.err};
        int open = 2;
        while (open > 0)
        {
            if (poll(fds, 2, -1) < 0)
            {
                if (errno == EINTR)
                    continue;
                break;
            }
            for (int i = 0; i < 2; ++i)
            {
                if (fds[i].fd < 0 || fds[i].revents == 0)
                    continue;
                char buffer[4096];
                ssize_t n = read(fds[i].fd, buffer, sizeof(buffer));
                if (n > 0)
                    sinks[i]->append(buffer, static_cast<size_t>(n));
                else if (n == 0 || errno != EINTR)
                {
                    fds[i].fd = -1;
                    --open;
                }
            }
        }
        ClosePipes(p);
    }

    void WaitForChild(pid_t pid, ChildResult& result)
    {
        int status = 0;
        while (waitpid(pid, &status, 0) < 0 && errno == EINTR)
        {
        }
        result.exited = WIFEXITED(status);
        result.exitStatus = result.exited ? WEXITSTATUS(status) : -1;
        result.termSignal = WIFSIGNALED(status) ? WTERMSIG(status) : 0;
    }

    ChildResult FailedToStart(const char* what)
    {
        ChildResult result;
        result.err = std::string("could not start child process: ") + what + ": " + strerror(errno);
        return result;
    }

    // Forks with standard output and error captured and runs `inChild` in the child, which must
    // end the child itself (_exit or exec); the parent collects the output and the exit status.
    ChildResult ForkAndCapture(const std::function<void()>& inChild)
    {
        Pipes pipes;
        if (!OpenPipes(pipes))
        {
            ChildResult failed = FailedToStart("pipe");
            ClosePipes(pipes);
            return failed;
        }
        // Buffered output written before the fork must not be written a second time by the child.
        fflush(stdout);
        fflush(stderr);
        const pid_t pid = fork();
        if (pid < 0)
        {
            ChildResult failed = FailedToStart("fork");
            ClosePipes(pipes);
            return failed;
        }
        if (pid == 0)
        {
            RedirectInChild(pipes);
            // An exception must not escape into the forked copy of the caller, which would go on
            // running the caller's code (a whole test run) inside the child.
            try
            {
                inChild();
            }
            catch (...)
            {
                fprintf(stderr, "uncaught exception in child process\n");
                fflush(nullptr);
            }
            _exit(127);
        }
        ChildResult result;
        DrainPipes(pipes, result);
        WaitForChild(pid, result);
        return result;
    }
}

ChildResult RunInChildProcess(const std::function<void()>& body)
{
    return ForkAndCapture([&] {
        // Crash signals must end the child for real, not be turned into a test failure.
        for (int sig : {SIGSEGV, SIGILL, SIGFPE, SIGBUS, SIGTRAP, SIGABRT})
            signal(sig, SIG_DFL);
        body();
        fflush(stdout);
        fflush(stderr);
        _exit(0);
    });
}

ChildResult RunProgram(const std::vector<std::string>& argv, const std::string& workDir,
                       const std::vector<std::string>& extraEnv)
{
    if (argv.empty())
        return FailedToStart("empty command line");
    return ForkAndCapture([&] {
        if (!workDir.empty() && chdir(workDir.c_str()) != 0)
        {
            fprintf(stderr, "cannot enter %s: %s\n", workDir.c_str(), strerror(errno));
            _exit(127);
        }
        for (const std::string& assignment : extraEnv)
            putenv(const_cast<char*>(assignment.c_str()));
        std::vector<char*> args;
        for (const std::string& a : argv)
            args.push_back(const_cast<char*>(a.c_str()));
        args.push_back(nullptr);
        execv(args[0], args.data());
        fprintf(stderr, "cannot run %s: %s\n", args[0], strerror(errno));
        _exit(127);
    });
}
}
