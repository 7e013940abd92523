#pragma once

#include <QString>

#include <memory>
#include <string>

class CDataManager;
class HostProblems;
class CMediator;
class CMessageBoxManager;
class CProcStartUpdateAgent;
class CBText;
class CQ17FileSystemWatcher;
class IComponentManager;
class PControllerFactoryBase;
class ToolConfigurationDialog;
class WidgetCommandBase;
template <class P>
class SmartProxy;

// What the host application does around the plug-in: starts the framework over a working folder,
// fills the data manager from the host configuration, loads the text catalogue, registers the
// framework's components, loads the plug-in, makes and initialises its two controllers and has
// the mediator build the tool-configuration window. Everything is given back in reverse order
// on destruction. One at a time per process (the component manager and the working folder are
// the process's); GUI thread, with a QApplication.
class ToolConfigurationHost
{
public:
    ToolConfigurationHost();
    ~ToolConfigurationHost();

    // `dataFolder` becomes the working folder: the paths in the host configuration are relative
    // to it. `configFile` relative paths are taken from the current folder before the change; an
    // empty one is "ToolConfigurationHost.xml" in the data folder. False with error() set when a
    // step that the window needs fails.
    bool start(const QString& dataFolder, const QString& configFile, const QString& language);

    ToolConfigurationDialog* dialog() const;
    CDataManager* dataManager() const;
    CMessageBoxManager* messageBoxManager() const;
    CProcStartUpdateAgent* updateAgentStarter() const;
    CMediator* mediator() const;
    // What the library has logged as warnings and errors since the last action; the window
    // lists them too.
    const HostProblems& problems() const;
    // The working folder, absolute.
    QString workingFolder() const;
    QString error() const;

private:
    ToolConfigurationHost(const ToolConfigurationHost&) = delete;
    ToolConfigurationHost& operator=(const ToolConfigurationHost&) = delete;

    bool fail(const QString& message);
    QString configuredPath(const wchar_t* uri, const QString& fallback) const;
    void stop();

    IComponentManager* m_manager;
    CDataManager* m_dataManager;
    CBText* m_text;
    CMessageBoxManager* m_messageBoxManager;
    CMediator* m_mediator;
    CProcStartUpdateAgent* m_updateAgentStarter;
    CQ17FileSystemWatcher* m_watcher;
    std::unique_ptr<SmartProxy<PControllerFactoryBase>> m_factory;
    std::unique_ptr<WidgetCommandBase> m_toolConfiguration;
    std::unique_ptr<WidgetCommandBase> m_users;
    ToolConfigurationDialog* m_dialog;
    std::unique_ptr<HostProblems> m_problems;
    QString m_previousFolder;
    QString m_workingFolder;
    std::string m_previousTasksFolder;
    QString m_error;
};
