#include "CLogsZipperGui.h"

#include "TesselLog_Static.h"
#include "WideString.h"

#include <QDir>
#include <QDirIterator>
#include <QFile>
#include <QFileDialog>
#include <QFileInfo>

#include <zip.h>

#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>

namespace
{
const char* const kComponent = "IhmUtils";
const char* const kFile = "IhmUtils.dll";
const char* const kClass = "CLogsZipperGui";

struct FolderSetting
{
    std::mutex mutex;
    QString folder;
};

FolderSetting& folderSetting()
{
    static FolderSetting setting;
    return setting;
}

void logFailure(const char* message, const QString& subject)
{
    TesselLog_Static::logError_static(kComponent, kFile, kClass, -1, "CLogsZipperGui::zipFolder: %s %s", message,
                                      subject.toUtf8().constData());
}

struct ArchiveDiscarder
{
    void operator()(zip_t* archive) const { zip_discard(archive); }
};

// Adds the whole content of `path` under `name`; the content is copied so that a log still
// being written cannot change under the archiver.
bool addFile(zip_t* archive, const QString& path, const QString& name)
{
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly))
    {
        logFailure("cannot read", path);
        return false;
    }
    const QByteArray content = file.readAll();
    void* buffer = std::malloc(content.isEmpty() ? 1 : static_cast<size_t>(content.size()));
    if (buffer == nullptr)
        return false;
    if (!content.isEmpty())
        std::memcpy(buffer, content.constData(), static_cast<size_t>(content.size()));
    zip_source_t* source = zip_source_buffer(archive, buffer, static_cast<zip_uint64_t>(content.size()), 1);
    if (source == nullptr)
    {
        std::free(buffer);
        return false;
    }
    const QByteArray entryName = name.toUtf8();
    if (zip_file_add(archive, entryName.constData(), source, ZIP_FL_ENC_UTF_8 | ZIP_FL_OVERWRITE) < 0)
    {
        zip_source_free(source);
        logFailure("cannot add", name);
        return false;
    }
    return true;
}
}

void CLogsZipperGui::setLogFolder(const QString& folder)
{
    FolderSetting& setting = folderSetting();
    std::lock_guard<std::mutex> lock(setting.mutex);
    setting.folder = folder;
}

QString CLogsZipperGui::logFolder()
{
    {
        FolderSetting& setting = folderSetting();
        std::lock_guard<std::mutex> lock(setting.mutex);
        if (!setting.folder.isEmpty())
            return setting.folder;
    }
    const ACE_WString logFile = TesselLog_Static::getLogFile();
    if (logFile.length() > 0)
        return QFileInfo(QString::fromStdWString(WideString::toStd(logFile))).absolutePath();
    return QDir::current().absoluteFilePath(QStringLiteral("Logs"));
}

bool CLogsZipperGui::zipFolder(const QString& folder, const QString& zipPath)
{
    const QFileInfo folderInfo(folder);
    if (!folderInfo.isDir())
    {
        logFailure("no folder", folder);
        return false;
    }
    const QString target = QFileInfo(zipPath).absoluteFilePath();
    const QDir root(folderInfo.absoluteFilePath());
    QStringList files;
    QDirIterator it(root.absolutePath(), QDir::Files | QDir::Hidden | QDir::NoDotAndDotDot,
                    QDirIterator::Subdirectories);
    while (it.hasNext())
    {
        const QString path = QFileInfo(it.next()).absoluteFilePath();
        if (path != target)
            files.append(path);
    }
    files.sort();
    if (files.isEmpty())
    {
        logFailure("nothing to archive in", folder);
        return false;
    }

    // libzip writes the archive to a temporary file beside the target and renames it over the
    // target when it is closed; discarding leaves any old archive as it was.
    int error = 0;
    std::unique_ptr<zip_t, ArchiveDiscarder> archive(
        zip_open(QFile::encodeName(target).constData(), ZIP_CREATE | ZIP_TRUNCATE, &error));
    if (!archive)
    {
        logFailure("cannot create", target);
        return false;
    }
    for (const QString& path : files)
    {
        if (!addFile(archive.get(), path, root.relativeFilePath(path)))
            return false;
    }
    if (zip_close(archive.get()) != 0)
    {
        logFailure("cannot write", target + QStringLiteral(": ") + QString::fromUtf8(zip_strerror(archive.get())));
        return false;
    }
    archive.release();
    TesselLog_Static::logInformation_static(
        kComponent, kFile, kClass, (L"CLogsZipperGui::zipFolder: logs written to " + target.toStdWString()).c_str());
    return true;
}

bool CLogsZipperGui::zipLogsWithGui()
{
    const QString folder = logFolder();
    QString path = QFileDialog::getSaveFileName(nullptr, QObject::tr("Save the logs"),
                                                QDir::home().absoluteFilePath(QStringLiteral("Logs.zip")),
                                                QObject::tr("Zip archives (*.zip)"));
    if (path.isEmpty())
        return false;
    if (!path.endsWith(QStringLiteral(".zip"), Qt::CaseInsensitive))
        path += QStringLiteral(".zip");
    return zipFolder(folder, path);
}
