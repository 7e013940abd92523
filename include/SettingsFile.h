#pragma once

#include "Export.h"

#include <cstddef>
#include <string>

// Reading and atomic writing of the files the system keeps (settings files, task files), with one
// size limit for both directions, so that a file written is always a file that loads.
class TESSEL_EXPORT SettingsFile
{
public:
    // Largest file read or written (4 MiB). The costliest file of this size (only empty sets)
    // grows the peak resident set by about 50 times its size.
    static constexpr std::size_t kMaxSize = 4 * 1024 * 1024;

    // The path with both separators taken as folder separators, as the Windows-call layer does.
    static std::string nativePath(const std::string& path);

    // Reads the whole regular file at `path`. Anything that is not a regular file (a FIFO, a
    // device, a folder) is refused at once, and so is a file over kMaxSize. On failure `error`
    // says why and `errorNumber` is the system's errno, or 0 when one of these rules refused it.
    static bool read(const std::string& path, std::string& bytes, std::string& error, int& errorNumber);

    // Writes `bytes` to `path` through a temporary file in the same folder (flushed, then renamed
    // over). Temporary files of `path` left behind by an interrupted save are removed first. More
    // than kMaxSize bytes are refused. A failure leaves any old file untouched.
    static bool writeAtomically(const std::string& path, const std::string& bytes, std::string& error,
                                int& errorNumber);

    // Whether `name` is the name of one of our temporary files for a file named `target`.
    static bool isTemporaryOf(const std::string& name, const std::string& target);
};
