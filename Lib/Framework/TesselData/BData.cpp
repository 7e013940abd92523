#include "BData.h"

#include "BSet.h"
#include "TesselLog_Static.h"
#include "WideString.h"
#include "XmlSetCodec.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

namespace
{
// Largest settings file read.
constexpr off_t kMaxFileSize = 16 * 1024 * 1024;

// Closes a file descriptor it owns.
class FileDescriptor
{
public:
    explicit FileDescriptor(int fd = -1) : m_fd(fd) {}
    ~FileDescriptor()
    {
        if (m_fd >= 0)
            ::close(m_fd);
    }
    FileDescriptor(const FileDescriptor&) = delete;
    FileDescriptor& operator=(const FileDescriptor&) = delete;
    int get() const { return m_fd; }
    // Closes now, reporting the result (a late write error shows here).
    bool close()
    {
        const int fd = m_fd;
        m_fd = -1;
        return fd < 0 || ::close(fd) == 0;
    }

private:
    int m_fd;
};

// Removes a temporary file unless told it was committed.
class TemporaryFile
{
public:
    explicit TemporaryFile(std::string path) : m_path(std::move(path)) {}
    ~TemporaryFile()
    {
        if (!m_committed)
            ::unlink(m_path.c_str());
    }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;
    void commit() { m_committed = true; }

private:
    std::string m_path;
    bool m_committed = false;
};

void warn(const char* operation, const std::string& path, const std::string& reason)
{
    TesselLog_Static::log_static(TesselLog_Static::eWARNING, 0, "TesselData", "libTesselData.so", "BData",
                                 L"BData::%S: '%S': %S", operation, path.c_str(), reason.c_str());
}

std::string systemError(const char* what)
{
    return std::string(what) + ": " + std::strerror(errno);
}

bool readFile(const std::string& path, std::string& bytes, std::string& error)
{
    FileDescriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC));
    if (file.get() < 0)
    {
        error = systemError("cannot open");
        return false;
    }
    struct stat info{};
    if (::fstat(file.get(), &info) != 0)
    {
        error = systemError("cannot stat");
        return false;
    }
    if (!S_ISREG(info.st_mode))
    {
        error = "not a regular file";
        return false;
    }
    if (info.st_size > kMaxFileSize)
    {
        error = "file larger than " + std::to_string(kMaxFileSize) + " bytes";
        return false;
    }
    bytes.clear();
    char buffer[65536];
    while (true)
    {
        const ssize_t got = ::read(file.get(), buffer, sizeof buffer);
        if (got < 0)
        {
            if (errno == EINTR)
                continue;
            error = systemError("cannot read");
            return false;
        }
        if (got == 0)
            break;
        bytes.append(buffer, static_cast<std::size_t>(got));
        // The file may grow while it is read.
        if (static_cast<off_t>(bytes.size()) > kMaxFileSize)
        {
            error = "file larger than " + std::to_string(kMaxFileSize) + " bytes";
            return false;
        }
    }
    return true;
}

bool writeAll(int fd, const std::string& bytes)
{
    std::size_t done = 0;
    while (done < bytes.size())
    {
        const ssize_t written = ::write(fd, bytes.data() + done, bytes.size() - done);
        if (written < 0)
        {
            if (errno == EINTR)
                continue;
            return false;
        }
        done += static_cast<std::size_t>(written);
    }
    return true;
}

std::string parentFolder(const std::string& path)
{
    const auto slash = path.rfind('/');
    if (slash == std::string::npos)
        return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

// Writes `bytes` to `path` through a temporary file in the same folder, then renames it over.
bool writeFileAtomically(const std::string& path, const std::string& bytes, std::string& error)
{
    std::string temporaryPath = path + ".tmp-XXXXXX";
    FileDescriptor file(::mkostemp(temporaryPath.data(), O_CLOEXEC));
    if (file.get() < 0)
    {
        error = systemError("cannot create temporary file");
        return false;
    }
    TemporaryFile temporary(temporaryPath);
    struct stat existing{};
    const mode_t mode = ::stat(path.c_str(), &existing) == 0 ? (existing.st_mode & 07777) : 0644;
    if (::fchmod(file.get(), mode) != 0)
    {
        error = systemError("cannot set permissions");
        return false;
    }
    if (!writeAll(file.get(), bytes))
    {
        error = systemError("cannot write");
        return false;
    }
    if (::fsync(file.get()) != 0)
    {
        error = systemError("cannot sync");
        return false;
    }
    if (!file.close())
    {
        error = systemError("cannot close");
        return false;
    }
    if (::rename(temporaryPath.c_str(), path.c_str()) != 0)
    {
        error = systemError("cannot rename");
        return false;
    }
    temporary.commit();
    // Make the rename itself durable; a failure here does not undo the save.
    FileDescriptor folder(::open(parentFolder(path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.get() >= 0)
        ::fsync(folder.get());
    return true;
}
}

BData::~BData() = default;

bool BData::load(const ACE_WString& path)
{
    const std::string file = WideString::toUtf8(path);
    if (type() != eSET)
    {
        warn("load", file, "only a set can be loaded");
        return false;
    }
    if (file.empty())
    {
        warn("load", file, "empty path");
        return false;
    }
    std::string bytes;
    std::string error;
    if (!readFile(file, bytes, error))
    {
        warn("load", file, error);
        return false;
    }
    BSet loaded;
    if (!XmlSetCodec::parse(bytes, loaded, error))
    {
        warn("load", file, error);
        return false;
    }
    static_cast<BSet&>(*this) = std::move(loaded);
    return true;
}

bool BData::save(const ACE_WString& path, bool /*flag*/) const
{
    const std::string file = WideString::toUtf8(path);
    if (type() != eSET)
    {
        warn("save", file, "only a set can be saved");
        return false;
    }
    if (file.empty())
    {
        warn("save", file, "empty path");
        return false;
    }
    std::string bytes;
    std::string error;
    if (!XmlSetCodec::write(static_cast<const BSet&>(*this), bytes, error) ||
        !writeFileAtomically(file, bytes, error))
    {
        warn("save", file, error);
        return false;
    }
    return true;
}
