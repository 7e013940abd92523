#include "ToolConfigurationHost.h"

#include "CBText.h"
#include "CDataManager.h"
#include "CMediator.h"
#include "CMessageBoxManager.h"
#include "CProcStartUpdateAgent.h"
#include "CQ17FileSystemWatcher.h"
#include "ComponentManagerFactory.h"
#include "HostProblems.h"
#include "ID.h"
#include "PControllerFactoryBase.h"
#include "SmartProxy.h"
#include "TaskSchedulerSettings.h"
#include "TesselLog_Static.h"
#include "ToolConfigurationDialog.h"
#include "WideString.h"
#include "WidgetCommandBase.h"

#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>

namespace
{
const char* const kComponent = "ToolConfigurationHost";
const char* const kFile = "ToolConfigurationHost";
const char* const kClass = "ToolConfigurationHost";

const char* const kFactoryID = "proc:ProcToolConfiguration?ToolConfigControllersFactory";
const wchar_t* const kConfigurationRoot = L"data:/Configuration";
const wchar_t* const kLogFileUri = L"data:/Configuration/Host/LogFile";
const wchar_t* const kTasksFolderUri = L"data:/Configuration/Host/TasksFolder";
const char* const kDefaultConfigFile = "ToolConfigurationHost.xml";

ACE_WString toWide(const QString& text)
{
    const std::wstring wide = text.toStdWString();
    return ACE_WString(wide.c_str(), wide.size());
}

QString toQString(const ACE_WString& text)
{
    return QString::fromWCharArray(text.c_str(), static_cast<qsizetype>(text.length()));
}

void warning(const QString& message)
{
    TesselLog_Static::logWarning_static(kComponent, kFile, kClass, toWide(message).c_str());
}
}

ToolConfigurationHost::ToolConfigurationHost()
    : m_manager(nullptr),
      m_dataManager(nullptr),
      m_text(nullptr),
      m_messageBoxManager(nullptr),
      m_mediator(nullptr),
      m_updateAgentStarter(nullptr),
      m_watcher(nullptr),
      m_dialog(nullptr),
      m_problems(std::make_unique<HostProblems>())
{
}

ToolConfigurationHost::~ToolConfigurationHost()
{
    stop();
}

bool ToolConfigurationHost::fail(const QString& message)
{
    m_error = message;
    TesselLog_Static::logError_static(kComponent, kFile, kClass, -1, "%s", message.toUtf8().constData());
    return false;
}

QString ToolConfigurationHost::configuredPath(const wchar_t* uri, const QString& fallback) const
{
    ACE_WString value;
    if (m_dataManager != nullptr)
        m_dataManager->getString(ID(uri), value);
    const QString path = value.length() > 0 ? toQString(value) : fallback;
    return QDir(m_workingFolder).absoluteFilePath(path);
}

bool ToolConfigurationHost::start(const QString& dataFolder, const QString& configFile, const QString& language)
{
    if (m_manager != nullptr)
        return fail(QStringLiteral("the host is already started"));
    const QFileInfo folder(dataFolder);
    if (!folder.isDir())
        return fail(QStringLiteral("data folder '%1' does not exist").arg(dataFolder));
    m_workingFolder = folder.absoluteFilePath();
    const QString config = configFile.isEmpty()
                               ? QDir(m_workingFolder).absoluteFilePath(QLatin1String(kDefaultConfigFile))
                               : QFileInfo(configFile).absoluteFilePath();
    m_previousFolder = QDir::currentPath();
    if (!QDir::setCurrent(m_workingFolder))
        return fail(QStringLiteral("cannot change to the data folder '%1'").arg(m_workingFolder));

    m_manager = ComponentManagerFactory::getComponentManager();
    if (m_manager == nullptr)
        return fail(QStringLiteral("no component manager"));
    m_manager->setLibraryPath(QCoreApplication::applicationDirPath().toStdString());

    m_dataManager = CDataManager::registerWith(*m_manager);
    m_text = CBText::registerWith(*m_manager);
    m_messageBoxManager = CMessageBoxManager::registerWith(*m_manager);
    m_mediator = CMediator::registerWith(*m_manager);
    m_updateAgentStarter = CProcStartUpdateAgent::registerWith(*m_manager);
    m_watcher = CQ17FileSystemWatcher::registerWith(*m_manager);
    if (m_dataManager == nullptr || m_text == nullptr || m_messageBoxManager == nullptr || m_mediator == nullptr ||
        m_updateAgentStarter == nullptr || m_watcher == nullptr)
        return fail(QStringLiteral("cannot register the framework's components (already registered?)"));

    if (!m_dataManager->preload(toWide(config), ID(kConfigurationRoot)))
        return fail(QStringLiteral("cannot read the host configuration '%1'").arg(config));

    const QString catalogueUri = QStringLiteral("data:/Configuration/Host/TextCatalogues/") + language;
    const QString catalogue =
        configuredPath(toWide(catalogueUri).c_str(), QStringLiteral("Texts/BText_%1.xml").arg(language));
    if (!m_text->loadCatalogue(toWide(catalogue)))
        return fail(QStringLiteral("no text catalogue for the language '%1' (%2)").arg(language, catalogue));

    const QString logFile = configuredPath(kLogFileUri, QStringLiteral("Logs/ToolConfiguration.log"));
    QDir().mkpath(QFileInfo(logFile).absolutePath());
    if (!TesselLog_Static::setLogFile(toWide(logFile)))
        warning(QStringLiteral("cannot write the log file '%1'").arg(logFile));

    const QString tasksFolder = configuredPath(kTasksFolderUri, QStringLiteral("Tasks"));
    QDir().mkpath(tasksFolder);
    m_previousTasksFolder = TaskSchedulerSettings::tasksFolder();
    TaskSchedulerSettings::setTasksFolder(tasksFolder.toStdString());
    TesselLog_Static::logInformation_static(kComponent, kFile, kClass,
                                            TaskSchedulerSettings::backend() == TaskSchedulerSettings::eCron
                                                ? L"task scheduler: cron (the tasks' lines in the crontab)"
                                                : L"task scheduler: files (the tasks are not run)");

    // Before the controllers: a changed file clears the list before they read it again.
    if (!m_problems->start())
        warning(QStringLiteral("cannot follow the log for the problems area"));

    m_factory = std::make_unique<SmartProxy<PControllerFactoryBase>>();
    if (!m_factory->acquire(ID(kFactoryID)))
        return fail(QStringLiteral("cannot load the plug-in %1").arg(QLatin1String(kFactoryID)));
    m_toolConfiguration.reset((*m_factory)->getControllerByName(ACE_WString(L"WC_TOOLCONFIGURATION")));
    m_users.reset((*m_factory)->getControllerByName(ACE_WString(L"WC_USERSCOMMAND")));
    if (!m_toolConfiguration || !m_users)
        return fail(QStringLiteral("the plug-in's factory made no controller for the dialog"));
    if (!m_toolConfiguration->init())
        warning(QStringLiteral("WC_TOOLCONFIGURATION: init failed"));
    if (!m_users->init())
        warning(QStringLiteral("WC_USERSCOMMAND: init failed"));

    m_dialog = m_mediator->createToolConfigurationDialog(m_toolConfiguration.get(), m_users.get());
    if (m_dialog == nullptr)
        return fail(QStringLiteral("the mediator built no window"));
    HostProblems* problems = m_problems.get();
    ToolConfigurationDialog* dialog = m_dialog;
    QObject::connect(dialog, &ToolConfigurationDialog::aboutToAct, problems, [problems](const QString& button) {
        if (button == QLatin1String("OKButton") || button == QLatin1String("CancelButton"))
            problems->beginAction();
    });
    auto show = [problems, dialog]() { dialog->showProblems(problems->texts(true), problems->texts(false)); };
    QObject::connect(problems, &HostProblems::changed, dialog, show);
    show();
    return true;
}

void ToolConfigurationHost::stop()
{
    // The controllers go first: the window forgets them, and the framework is still there for
    // their destructors.
    m_users.reset();
    m_toolConfiguration.reset();
    m_factory.reset();
    m_dialog = nullptr;
    m_problems->stop();
    if (m_manager != nullptr)
    {
        m_manager->destroyAllComponents();
        m_manager->release();
        m_manager = nullptr;
        TesselLog_Static::setLogFile(ACE_WString());
        TaskSchedulerSettings::setTasksFolder(m_previousTasksFolder);
    }
    m_dataManager = nullptr;
    m_text = nullptr;
    m_messageBoxManager = nullptr;
    m_mediator = nullptr;
    m_updateAgentStarter = nullptr;
    m_watcher = nullptr;
    if (!m_previousFolder.isEmpty())
        QDir::setCurrent(m_previousFolder);
    m_previousFolder.clear();
}

ToolConfigurationDialog* ToolConfigurationHost::dialog() const
{
    return m_dialog;
}

CDataManager* ToolConfigurationHost::dataManager() const
{
    return m_dataManager;
}

CMessageBoxManager* ToolConfigurationHost::messageBoxManager() const
{
    return m_messageBoxManager;
}

CProcStartUpdateAgent* ToolConfigurationHost::updateAgentStarter() const
{
    return m_updateAgentStarter;
}

CMediator* ToolConfigurationHost::mediator() const
{
    return m_mediator;
}

const HostProblems& ToolConfigurationHost::problems() const
{
    return *m_problems;
}

QString ToolConfigurationHost::workingFolder() const
{
    return m_workingFolder;
}

QString ToolConfigurationHost::error() const
{
    return m_error;
}
