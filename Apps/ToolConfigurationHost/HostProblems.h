#pragma once

#include "CustomEvent.h"
#include "Handler.h"

#include <QObject>
#include <QString>
#include <QStringList>

#include <cstdint>
#include <mutex>
#include <vector>

// The warnings and errors the library logs while the window is open, for the window's problems
// area and the scripted run's report. Each action that starts afresh (OK, Cancel, a settings file
// changed on disk) clears what the one before reported, so a problem that the action resolved is
// gone and one that remains is logged, and listed, again. Lines logged on other threads arrive
// queued. GUI thread, with a QApplication.
class HostProblems : public QObject, public Handler<CustomEvent>
{
    Q_OBJECT

public:
    struct Problem
    {
        bool error;
        QString text;
        int count;
    };

    HostProblems();
    ~HostProblems() override;

    // Starts listening to the log and to the file-changed events. Call before the controllers
    // register, so that a file change clears the list before they reload.
    bool start();
    void stop();

    // Forgets what is listed: an action starts.
    void beginAction();

    const std::vector<Problem>& problems() const;
    // One line per problem: "error: ..." or "warning: ...", with " (N times)" for repeats.
    QStringList lines() const;
    // The texts of the errors, or of the warnings, with " (N times)" for repeats.
    QStringList texts(bool errors) const;

    void handleEvent(const CustomEvent& event) override;

signals:
    void changed();

private:
    HostProblems(const HostProblems&) = delete;
    HostProblems& operator=(const HostProblems&) = delete;

    void take(std::uint64_t serial, bool error, const QString& text);

    std::mutex m_mutex;
    std::uint64_t m_serial;    // under m_mutex: lines seen so far
    std::uint64_t m_clearedAt; // GUI thread: lines up to this serial are forgotten
    std::vector<Problem> m_problems;
    int m_sink;
};
