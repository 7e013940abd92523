// The host application: shows the tool-configuration window over a working folder of settings.
// Without a display it renders the window off screen, writes a screenshot and prints a summary.

#include "HostHelp.h"
#include "HostProblems.h"
#include "TaskSchedulerSettings.h"
#include "TesselLog_Static.h"
#include "ToolConfigurationDialog.h"
#include "ToolConfigurationHost.h"

#include <QApplication>
#include <QCommandLineParser>
#include <QDir>
#include <QFileInfo>
#include <QGuiApplication>
#include <QPixmap>

#include <cstdio>
#include <cstdlib>

namespace
{
// What the process answers; --help lists them.
enum ExitCode
{
    eDONE = 0,
    eNOT_SHOWN = 1,
    eBAD_COMMAND_LINE = 2,
    eSAVE_FAILED = 3
};

const int kScreenshotQuality = 80;

bool hasDisplay()
{
    const QByteArray platform = qgetenv("QT_QPA_PLATFORM");
    if (!platform.isEmpty())
        return platform != "offscreen" && platform != "minimal";
    return !qEnvironmentVariableIsEmpty("DISPLAY") || !qEnvironmentVariableIsEmpty("WAYLAND_DISPLAY");
}

void print(const QString& line)
{
    std::printf("%s\n", line.toLocal8Bit().constData());
}

void printError(const QString& line)
{
    std::fprintf(stderr, "ToolConfigurationHost: %s\n", line.toLocal8Bit().constData());
}

// Qt's own diagnostics go to the log file, not to the person's terminal.
void logQtMessage(QtMsgType type, const QMessageLogContext&, const QString& message)
{
    if (type == QtFatalMsg)
    {
        std::fprintf(stderr, "ToolConfigurationHost: %s\n", message.toLocal8Bit().constData());
        std::abort();
    }
    TesselLog_Static::logInformation_static("Qt", "Qt", "Qt", message.toStdWString().c_str());
}
}

int main(int argc, char** argv)
{
    qInstallMessageHandler(logQtMessage);
    const bool display = hasDisplay();
    if (!display)
        qputenv("QT_QPA_PLATFORM", "offscreen");
    QApplication application(argc, argv);
    QApplication::setApplicationName(QStringLiteral("ToolConfigurationHost"));

    QCommandLineParser parser;
    const QCommandLineOption helpOption({QStringLiteral("h"), QStringLiteral("help")},
                                        QStringLiteral("Print the help."));
    const QCommandLineOption listControlsOption(QStringLiteral("list-controls"),
                                                QStringLiteral("Print the controls --set takes."));
    const QCommandLineOption dataOption(
        QStringLiteral("data"), QStringLiteral("Working folder with the settings (default: the current folder)."),
        QStringLiteral("DIR"), QDir::currentPath());
    const QCommandLineOption configOption(
        QStringLiteral("config"), QStringLiteral("Host configuration (default: DIR/ToolConfigurationHost.xml)."),
        QStringLiteral("FILE"));
    const QCommandLineOption languageOption(QStringLiteral("language"),
                                            QStringLiteral("Language of the texts: en or fr."), QStringLiteral("LANG"),
                                            QStringLiteral("en"));
    const QCommandLineOption screenshotOption(QStringLiteral("screenshot"),
                                              QStringLiteral("Write a PNG picture of the window to FILE."),
                                              QStringLiteral("FILE"));
    const QCommandLineOption setOption(
        QStringLiteral("set"), QStringLiteral("Change a field through its widget, e.g. NameEdit=Smith (repeatable)."),
        QStringLiteral("Control=Value"));
    const QCommandLineOption pressOption(QStringLiteral("press"),
                                         QStringLiteral("Press ok or cancel after the changes, then exit."),
                                         QStringLiteral("ok|cancel"));
    const QCommandLineOption schedulerOption(
        QStringLiteral("scheduler"),
        QStringLiteral("Who runs the daily task: cron (the default where crontab exists) or files (nobody)."),
        QStringLiteral("files|cron"));
    parser.addOptions({helpOption, listControlsOption, dataOption, configOption, languageOption, screenshotOption,
                       setOption, pressOption, schedulerOption});
    if (!parser.parse(QCoreApplication::arguments()))
    {
        printError(parser.errorText() + QStringLiteral(" (--help lists the options)"));
        return eBAD_COMMAND_LINE;
    }
    if (parser.isSet(helpOption))
    {
        std::fputs(kHostHelp, stdout);
        return eDONE;
    }
    if (!parser.positionalArguments().isEmpty())
    {
        printError(QStringLiteral("unexpected argument '%1' (--help lists the options)")
                       .arg(parser.positionalArguments().first()));
        return eBAD_COMMAND_LINE;
    }

    const QString scheduler = parser.isSet(schedulerOption)
                                  ? parser.value(schedulerOption)
                                  : QLatin1String(TaskSchedulerSettings::crontabAvailable() ? "cron" : "files");
    if (scheduler != QLatin1String("files") && scheduler != QLatin1String("cron"))
    {
        printError(QStringLiteral("--scheduler takes files or cron, not '%1'").arg(scheduler));
        return eBAD_COMMAND_LINE;
    }
    TaskSchedulerSettings::setBackend(scheduler == QLatin1String("cron") ? TaskSchedulerSettings::eCron
                                                                         : TaskSchedulerSettings::eFiles);

    const QString language = parser.value(languageOption);
    if (language != QLatin1String("en") && language != QLatin1String("fr"))
    {
        printError(QStringLiteral("unknown language '%1' (en or fr)").arg(language));
        return eBAD_COMMAND_LINE;
    }
    const QString press = parser.value(pressOption).toLower();
    if (!press.isEmpty() && press != QLatin1String("ok") && press != QLatin1String("cancel"))
    {
        printError(QStringLiteral("--press takes ok or cancel, not '%1'").arg(press));
        return eBAD_COMMAND_LINE;
    }
    // Relative paths on the command line are the caller's, not the working folder's.
    QString screenshot = parser.value(screenshotOption);
    if (!screenshot.isEmpty())
        screenshot = QFileInfo(screenshot).absoluteFilePath();

    ToolConfigurationHost host;
    if (!host.start(parser.value(dataOption), parser.value(configOption), language))
    {
        printError(host.error());
        return eNOT_SHOWN;
    }
    ToolConfigurationDialog* dialog = host.dialog();
    if (parser.isSet(listControlsOption))
    {
        for (const QString& control : dialog->fieldControls())
            print(control);
        return eDONE;
    }
    dialog->show();
    QApplication::processEvents();

    for (const QString& assignment : parser.values(setOption))
    {
        const int equals = assignment.indexOf(QLatin1Char('='));
        QString error;
        if (equals <= 0)
            error = QStringLiteral("--set takes Control=Value, not '%1'").arg(assignment);
        else if (dialog->setFieldValue(assignment.left(equals), assignment.mid(equals + 1), &error))
            continue;
        printError(error);
        return eBAD_COMMAND_LINE;
    }
    QApplication::processEvents();

    if (screenshot.isEmpty() && !display)
        screenshot = QDir(host.workingFolder()).absoluteFilePath(QStringLiteral("ToolConfiguration.png"));
    if (!screenshot.isEmpty())
    {
        // Quality 80 is the writer's fastest compression (level 1); the default, level 6, took
        // most of a non-interactive run for a few percent of file size.
        if (!dialog->grab().save(screenshot, "PNG", kScreenshotQuality))
        {
            printError(QStringLiteral("cannot write the screenshot '%1'").arg(screenshot));
            return eNOT_SHOWN;
        }
        print(QStringLiteral("Screenshot: %1").arg(screenshot));
    }
    bool saveFailed = false;
    if (!press.isEmpty())
    {
        const bool ok = press == QLatin1String("ok");
        if (!dialog->clickButton(ok ? QStringLiteral("OKButton") : QStringLiteral("CancelButton")))
        {
            printError(QStringLiteral("the %1 button cannot be pressed").arg(press));
            return eNOT_SHOWN;
        }
        QApplication::processEvents();
        print(QStringLiteral("Pressed %1; the window is %2.")
                  .arg(ok ? QStringLiteral("OK") : QStringLiteral("Cancel"),
                       dialog->isVisible() ? QStringLiteral("still open") : QStringLiteral("closed")));
        // Whatever OK logs as a warning or an error is a part of its work that was not done.
        saveFailed = ok && !host.problems().problems().empty();
        if (saveFailed)
        {
            printError(QStringLiteral("OK did not save everything:"));
            for (const QString& line : host.problems().lines())
                printError(QStringLiteral("  ") + line);
        }
    }
    if (!display || !press.isEmpty())
    {
        print(QStringLiteral("Working folder: %1").arg(host.workingFolder()));
        print(QStringLiteral("Scheduler: %1").arg(scheduler));
        for (const QString& line : dialog->summary())
            print(QStringLiteral("  ") + line);
        const QStringList problems = host.problems().lines();
        if (!problems.isEmpty())
            print(QStringLiteral("Problems:"));
        for (const QString& line : problems)
            print(QStringLiteral("  ") + line);
        return saveFailed ? eSAVE_FAILED : eDONE;
    }

    QObject::connect(dialog, &QDialog::finished, &application, &QCoreApplication::quit);
    return application.exec();
}
