#include "ChildProcess.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>

extern char** environ;

namespace
{
// One file descriptor, closed on destruction.
class Fd
{
public:
    Fd() = default;
    ~Fd() { reset(); }
    Fd(const Fd&) = delete;
    Fd& operator=(const Fd&) = delete;

    int get() const { return m_fd; }
    int* out()
    {
        reset();
        return &m_fd;
    }
    void reset()
    {
        if (m_fd >= 0)
            ::close(m_fd);
        m_fd = -1;
    }

private:
    int m_fd = -1;
};

// Both ends of a socket pair or a pipe.
struct Channel
{
    Fd ours;
    Fd theirs;
};

bool makePipe(Channel& channel)
{
    int fds[2];
    if (::pipe2(fds, O_CLOEXEC) != 0)
        return false;
    *channel.ours.out() = fds[0];
    *channel.theirs.out() = fds[1];
    return true;
}

// A socket pair rather than a pipe for the input: writes to it can be told not to raise SIGPIPE.
bool makeInputChannel(Channel& channel)
{
    int fds[2];
    if (::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, fds) != 0)
        return false;
    *channel.ours.out() = fds[0];
    *channel.theirs.out() = fds[1];
    return ::shutdown(fds[1], SHUT_WR) == 0 && ::fcntl(fds[0], F_SETFL, O_NONBLOCK) == 0;
}

class SpawnActions
{
public:
    SpawnActions() { m_ready = posix_spawn_file_actions_init(&m_actions) == 0; }
    ~SpawnActions()
    {
        if (m_ready)
            posix_spawn_file_actions_destroy(&m_actions);
    }
    SpawnActions(const SpawnActions&) = delete;
    SpawnActions& operator=(const SpawnActions&) = delete;

    bool redirect(int from, int to) { return m_ready && posix_spawn_file_actions_adddup2(&m_actions, from, to) == 0; }
    const posix_spawn_file_actions_t* get() const { return &m_actions; }

private:
    posix_spawn_file_actions_t m_actions;
    bool m_ready = false;
};

// The started child: killed (when still running) and reaped on destruction.
class Child
{
public:
    explicit Child(pid_t pid) : m_pid(pid) {}
    ~Child()
    {
        if (m_pid <= 0)
            return;
        ::kill(m_pid, SIGKILL);
        int status = 0;
        while (::waitpid(m_pid, &status, 0) < 0 && errno == EINTR)
        {
        }
    }
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;

    // True once the child has ended, with its exit status or -1.
    bool ended(int& exitStatus)
    {
        int status = 0;
        const pid_t waited = ::waitpid(m_pid, &status, WNOHANG);
        if (waited == 0 || (waited < 0 && errno == EINTR))
            return false;
        m_pid = 0;
        exitStatus = waited > 0 && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
        return true;
    }

private:
    pid_t m_pid;
};

// Appends what is there to read; false at end of file or on error.
bool drain(int fd, std::string& into)
{
    char buffer[4096];
    const ssize_t got = ::read(fd, buffer, sizeof buffer);
    if (got > 0)
    {
        into.append(buffer, static_cast<size_t>(got));
        return true;
    }
    return got < 0 && (errno == EINTR || errno == EAGAIN);
}
}

ChildProcess::Result ChildProcess::run(const std::vector<std::string>& argv, const std::string& input,
                                       int timeoutMilliseconds)
{
    Result result;
    if (argv.empty())
    {
        result.startError = EINVAL;
        return result;
    }
    Channel in, out, err;
    SpawnActions actions;
    if (!makeInputChannel(in) || !makePipe(out) || !makePipe(err) || !actions.redirect(in.theirs.get(), 0) ||
        !actions.redirect(out.theirs.get(), 1) || !actions.redirect(err.theirs.get(), 2))
    {
        result.startError = errno != 0 ? errno : EIO;
        return result;
    }
    std::vector<char*> arguments;
    for (const std::string& argument : argv)
        arguments.push_back(const_cast<char*>(argument.c_str()));
    arguments.push_back(nullptr);
    pid_t pid = 0;
    const int spawned = posix_spawnp(&pid, arguments[0], actions.get(), nullptr, arguments.data(), environ);
    if (spawned != 0)
    {
        result.startError = spawned;
        return result;
    }
    Child child(pid);
    in.theirs.reset();
    out.theirs.reset();
    err.theirs.reset();

    size_t written = 0;
    if (input.empty())
        in.ours.reset();
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(timeoutMilliseconds);
    bool outOpen = true;
    bool errOpen = true;
    while (outOpen || errOpen)
    {
        const auto left =
            std::chrono::duration_cast<std::chrono::milliseconds>(deadline - std::chrono::steady_clock::now()).count();
        if (left <= 0)
        {
            result.timedOut = true;
            return result;
        }
        pollfd fds[3] = {{out.ours.get(), POLLIN, 0}, {err.ours.get(), POLLIN, 0}, {in.ours.get(), POLLOUT, 0}};
        fds[0].fd = outOpen ? out.ours.get() : -1;
        fds[1].fd = errOpen ? err.ours.get() : -1;
        if (::poll(fds, 3, static_cast<int>(left)) < 0)
        {
            if (errno == EINTR)
                continue;
            result.startError = errno;
            return result;
        }
        if (fds[0].revents != 0)
            outOpen = drain(out.ours.get(), result.output);
        if (fds[1].revents != 0)
            errOpen = drain(err.ours.get(), result.errors);
        if (fds[2].fd >= 0 && fds[2].revents != 0)
        {
            const ssize_t sent = ::send(in.ours.get(), input.data() + written, input.size() - written, MSG_NOSIGNAL);
            if (sent > 0)
                written += static_cast<size_t>(sent);
            // The child may stop reading early (it failed); its exit status tells.
            if ((sent < 0 && errno != EINTR && errno != EAGAIN) || written == input.size())
                in.ours.reset();
        }
    }
    in.ours.reset();
    // Both outputs are closed; the child is about to end.
    while (!child.ended(result.exitStatus))
    {
        if (std::chrono::steady_clock::now() >= deadline)
        {
            result.timedOut = true;
            return result;
        }
        ::poll(nullptr, 0, 5);
    }
    return result;
}
