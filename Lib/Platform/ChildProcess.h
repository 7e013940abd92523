#pragma once

#include "Export.h"

#include <string>
#include <vector>

// Runs a program without a shell: `argv[0]` is looked up in PATH when it holds no '/'. The child
// reads `input` on its standard input; its standard output and error are collected. A child still
// running after the time limit is killed. The child is always reaped before run returns.
class TESSEL_EXPORT ChildProcess
{
public:
    struct Result
    {
        // 0 when the program ran; otherwise the errno of the failure to start or to talk to it.
        int startError = 0;
        bool timedOut = false;
        // The exit status, or -1 when the child did not exit normally.
        int exitStatus = -1;
        std::string output;
        std::string errors;
    };

    static Result run(const std::vector<std::string>& argv, const std::string& input, int timeoutMilliseconds);
};
