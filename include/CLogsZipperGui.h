#pragma once

#include "Export.h"

#include <QString>

// Lets the user pick a zip file and writes the log folder into it.
class TESSEL_EXPORT CLogsZipperGui
{
public:
    // Asks for the target file, then zips; false when cancelled or on failure.
    static bool zipLogsWithGui();
    // The folder archived: the folder of the log file, unless set.
    static void setLogFolder(const QString& folder);
    static QString logFolder();
    // The archiving itself, without a dialog.
    static bool zipFolder(const QString& folder, const QString& zipPath);
};
