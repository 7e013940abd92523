#include "HostProblems.h"

#include "CQ17FileSystemWatcher.h"
#include "ID.h"
#include "TesselLog_Static.h"

#include <QCoreApplication>
#include <QThread>

namespace
{
const wchar_t* const kHandlerID = L"host:ToolConfigurationHost?Problems";
}

HostProblems::HostProblems() : m_serial(0), m_clearedAt(0), m_sink(0)
{
}

HostProblems::~HostProblems()
{
    stop();
}

bool HostProblems::start()
{
    if (m_sink != 0)
        return true;
    auto take = [this](const TesselLog_Static::Record& record) {
        std::uint64_t serial = 0;
        {
            std::lock_guard<std::mutex> lock(m_mutex);
            serial = ++m_serial;
        }
        const bool error = record.level >= TesselLog_Static::eERROR;
        const QString text =
            QString::fromWCharArray(record.message.c_str(), static_cast<qsizetype>(record.message.length()));
        if (QThread::currentThread() == thread())
            this->take(serial, error, text);
        else
            QMetaObject::invokeMethod(
                this, [this, serial, error, text]() { this->take(serial, error, text); }, Qt::QueuedConnection);
    };
    m_sink = TesselLog_Static::addSink(take, TesselLog_Static::eWARNING);
    if (m_sink == 0)
        return false;
    return Register(ID(kHandlerID)) == 0;
}

void HostProblems::stop()
{
    if (isRegistered())
        unregister(ID(kHandlerID));
    if (m_sink != 0)
        TesselLog_Static::removeSink(m_sink);
    m_sink = 0;
}

void HostProblems::beginAction()
{
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_clearedAt = m_serial;
    }
    if (m_problems.empty())
        return;
    m_problems.clear();
    emit changed();
}

void HostProblems::take(std::uint64_t serial, bool error, const QString& text)
{
    if (serial <= m_clearedAt)
        return;
    for (Problem& problem : m_problems)
    {
        if (problem.error == error && problem.text == text)
        {
            ++problem.count;
            emit changed();
            return;
        }
    }
    m_problems.push_back({error, text, 1});
    emit changed();
}

const std::vector<HostProblems::Problem>& HostProblems::problems() const
{
    return m_problems;
}

namespace
{
QString withCount(const HostProblems::Problem& problem)
{
    return problem.count > 1 ? QStringLiteral("%1 (%2 times)").arg(problem.text).arg(problem.count) : problem.text;
}
}

QStringList HostProblems::lines() const
{
    QStringList lines;
    for (const Problem& problem : m_problems)
        lines << (problem.error ? QStringLiteral("error: ") : QStringLiteral("warning: ")) + withCount(problem);
    return lines;
}

QStringList HostProblems::texts(bool errors) const
{
    QStringList texts;
    for (const Problem& problem : m_problems)
        if (problem.error == errors)
            texts << withCount(problem);
    return texts;
}

void HostProblems::handleEvent(const CustomEvent& event)
{
    if (event.get_type() != CQ17FileSystemWatcher::eventType)
        return;
    // The watcher posts on the GUI thread; anywhere else the clear waits its turn there.
    if (QThread::currentThread() == thread())
        beginAction();
    else
        QMetaObject::invokeMethod(
            this, [this]() { beginAction(); }, Qt::QueuedConnection);
}
