#include "SettingsFile.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace
{
const char kTemporaryInfix[] = ".tmp-";
const std::size_t kTemporarySuffixLength = 6;

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

bool fail(std::string& error, int& errorNumber, const char* what)
{
    errorNumber = errno;
    error = std::string(what) + ": " + std::strerror(errorNumber);
    return false;
}

bool refuse(std::string& error, int& errorNumber, std::string reason)
{
    errorNumber = 0;
    error = std::move(reason);
    return false;
}

std::string tooLarge()
{
    return "file larger than " + std::to_string(SettingsFile::kMaxSize) + " bytes";
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

std::string fileName(const std::string& path)
{
    const auto slash = path.rfind('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

// Whether `name` is `prefix` (a target's name and the infix) followed by the random suffix.
bool isTemporaryName(const char* name, std::size_t length, const std::string& prefix)
{
    return length == prefix.size() + kTemporarySuffixLength && std::memcmp(name, prefix.data(), prefix.size()) == 0;
}

// Removes the temporaries of `path` that an interrupted save left in its folder.
void removeStaleTemporaries(const std::string& path)
{
    const std::string folder = parentFolder(path);
    const std::string prefix = fileName(path) + kTemporaryInfix;
    DIR* directory = ::opendir(folder.c_str());
    if (directory == nullptr)
        return;
    while (const dirent* entry = ::readdir(directory))
    {
        if (isTemporaryName(entry->d_name, std::strlen(entry->d_name), prefix))
            ::unlinkat(::dirfd(directory), entry->d_name, 0);
    }
    ::closedir(directory);
}
}

std::string SettingsFile::nativePath(const std::string& path)
{
    std::string result = path;
    std::replace(result.begin(), result.end(), '\\', '/');
    return result;
}

bool SettingsFile::isTemporaryOf(const std::string& name, const std::string& target)
{
    return isTemporaryName(name.data(), name.size(), target + kTemporaryInfix);
}

bool SettingsFile::read(const std::string& path, std::string& bytes, std::string& error, int& errorNumber)
{
    // Non-blocking, so that opening a FIFO does not wait for a writer; the type is checked next.
    FileDescriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    if (file.get() < 0)
        return fail(error, errorNumber, "cannot open");
    struct stat info
    {};
    if (::fstat(file.get(), &info) != 0)
        return fail(error, errorNumber, "cannot stat");
    if (!S_ISREG(info.st_mode))
        return refuse(error, errorNumber, "not a regular file");
    if (info.st_size < 0 || static_cast<std::size_t>(info.st_size) > kMaxSize)
        return refuse(error, errorNumber, tooLarge());
    bytes.clear();
    bytes.reserve(static_cast<std::size_t>(info.st_size));
    char buffer[65536];
    while (true)
    {
        const ssize_t got = ::read(file.get(), buffer, sizeof buffer);
        if (got < 0)
        {
            if (errno == EINTR)
                continue;
            return fail(error, errorNumber, "cannot read");
        }
        if (got == 0)
            break;
        bytes.append(buffer, static_cast<std::size_t>(got));
        // The file may grow while it is read.
        if (bytes.size() > kMaxSize)
            return refuse(error, errorNumber, tooLarge());
    }
    errorNumber = 0;
    return true;
}

bool SettingsFile::writeAtomically(const std::string& path, const std::string& bytes, std::string& error,
                                   int& errorNumber)
{
    if (bytes.size() > kMaxSize)
        return refuse(error, errorNumber, "content larger than " + std::to_string(kMaxSize) + " bytes");
    removeStaleTemporaries(path);
    std::string temporaryPath = path + kTemporaryInfix + "XXXXXX";
    FileDescriptor file(::mkostemp(temporaryPath.data(), O_CLOEXEC));
    if (file.get() < 0)
        return fail(error, errorNumber, "cannot create temporary file");
    TemporaryFile temporary(temporaryPath);
    struct stat existing
    {};
    const mode_t mode = ::stat(path.c_str(), &existing) == 0 ? (existing.st_mode & 07777) : 0644;
    if (::fchmod(file.get(), mode) != 0)
        return fail(error, errorNumber, "cannot set permissions");
    if (!writeAll(file.get(), bytes))
        return fail(error, errorNumber, "cannot write");
    if (::fsync(file.get()) != 0)
        return fail(error, errorNumber, "cannot sync");
    if (!file.close())
        return fail(error, errorNumber, "cannot close");
    if (::rename(temporaryPath.c_str(), path.c_str()) != 0)
        return fail(error, errorNumber, "cannot rename");
    temporary.commit();
    // Make the rename itself durable; a failure here does not undo the save.
    FileDescriptor folder(::open(parentFolder(path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.get() >= 0)
        ::fsync(folder.get());
    errorNumber = 0;
    return true;
}
