#pragma once

#include "Export.h"

#include <ace/SString.h>

#include <cstdarg>
#include <functional>
#include <string>

// The framework's process-wide logger.
//
// Formats follow the original platform: in a wide format "%s" takes a wide string and "%S" a
// narrow (UTF-8) one; in a narrow format "%s" takes a narrow string and "%S" a wide one.
// Lines go to the log file named with setLogFile (if any) and to every registered sink.
class TESSEL_EXPORT TesselLog_Static
{
public:
    enum Level
    {
        eTRACE = 1,
        eINFORMATION = 2,
        eWARNING = 4,
        eERROR = 16
    };

    struct Record
    {
        int level;
        int code;
        std::string component;
        std::string file;
        std::string className;
        ACE_WString message;
    };
    using Sink = std::function<void(const Record&)>;

    static void logTrace_static(const char* component, const char* file, const char* className, const wchar_t* message);
    static void logInformation_static(const char* component, const char* file, const char* className,
                                      const wchar_t* message);
    static void logWarning_static(const char* component, const char* file, const char* className,
                                  const wchar_t* message);
    static void logError_static(const char* component, const char* file, const char* className, int code,
                                const char* format, ...);
    static void logError_static(const char* component, const char* file, const char* className, int code,
                                const wchar_t* format, ...);
    // Generic entry point: `level` is one of Level (16 failures, 1 tolerated conditions).
    static void log_static(int level, int code, const char* component, const char* file, const char* className,
                           const wchar_t* format, ...);

    // Verbosity of the log file: 10 writes every line (recording mode), 0 only warnings and
    // errors. Sinks receive the lines of their own levels.
    static void setLevel_static(int level);
    static int getLevel_static();
    // Whether a line of `level` would be written anywhere (the file or a sink). The entry
    // points check this first: a line nobody records is neither formatted nor written.
    static bool isRecorded_static(int level);

    // Appends lines to `path` (UTF-8); an empty path stops file logging.
    static bool setLogFile(const ACE_WString& path);
    static ACE_WString getLogFile();

    // Sinks see every record of `minimumLevel` or above, on the thread that logs; lines below
    // every sink's level and the file's are not even formatted. Returns a handle for removeSink.
    static int addSink(Sink sink, int minimumLevel = eTRACE);
    static void removeSink(int handle);
};

// Signature of TesselLog_Static::log_static, for modules that log through a pointer.
using TesselLogFunction = void (*)(int level, int code, const char* component, const char* file, const char* className,
                                   const wchar_t* format, ...);
