// The host application: shows the tool-configuration window over a working folder of settings.
// Without a display it renders the window off screen, writes a screenshot and prints a summary.

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
}

int main(int argc, char** argv)
{
    const bool display = hasDisplay();
    if (!display)
        qputenv("QT_QPA_PLATFORM", "offscreen");
    QApplication application(argc, argv);
    QApplication::setApplicationName(QStringLiteral("ToolConfigurationHost"));

    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral("Tool configuration: workshop, online update, App2App and users."));
    parser.addHelpOption();
    const QCommandLineOption dataOption(QStringLiteral("data"), QStringLiteral("Working folder with the settings (default: the current folder)."),
                                        QStringLiteral("DIR"), QDir::currentPath());
    const QCommandLineOption configOption(QStringLiteral("config"),
                                          QStringLiteral("Host configuration (default: DIR/ToolConfigurationHost.xml)."),
                                          QStringLiteral("FILE"));
    const QCommandLineOption languageOption(QStringLiteral("language"), QStringLiteral("Language of the texts: en or fr."),
                                            QStringLiteral("LANG"), QStringLiteral("en"));
    const QCommandLineOption screenshotOption(QStringLiteral("screenshot"),
                                              QStringLiteral("Write a PNG picture of the window to FILE."),
                                              QStringLiteral("FILE"));
    const QCommandLineOption setOption(QStringLiteral("set"),
                                       QStringLiteral("Change a field through its widget, e.g. NameEdit=Smith (repeatable)."),
                                       QStringLiteral("Control=Value"));
    const QCommandLineOption pressOption(QStringLiteral("press"),
                                         QStringLiteral("Press ok or cancel after the changes, then exit."),
                                         QStringLiteral("ok|cancel"));
    parser.addOptions({dataOption, configOption, languageOption, screenshotOption, setOption, pressOption});
    parser.process(application);

    const QString language = parser.value(languageOption);
    if (language != QLatin1String("en") && language != QLatin1String("fr"))
    {
        printError(QStringLiteral("unknown language '%1' (en or fr)").arg(language));
        return 2;
    }
    const QString press = parser.value(pressOption).toLower();
    if (!press.isEmpty() && press != QLatin1String("ok") && press != QLatin1String("cancel"))
    {
        printError(QStringLiteral("--press takes ok or cancel, not '%1'").arg(press));
        return 2;
    }
    // Relative paths on the command line are the caller's, not the working folder's.
    QString screenshot = parser.value(screenshotOption);
    if (!screenshot.isEmpty())
        screenshot = QFileInfo(screenshot).absoluteFilePath();

    ToolConfigurationHost host;
    if (!host.start(parser.value(dataOption), parser.value(configOption), language))
    {
        printError(host.error());
        return 1;
    }
    ToolConfigurationDialog* dialog = host.dialog();
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
        return 2;
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
            return 1;
        }
        print(QStringLiteral("Screenshot: %1").arg(screenshot));
    }
    if (!press.isEmpty())
    {
        const bool ok = press == QLatin1String("ok");
        if (!dialog->clickButton(ok ? QStringLiteral("OKButton") : QStringLiteral("CancelButton")))
        {
            printError(QStringLiteral("the %1 button cannot be pressed").arg(press));
            return 1;
        }
        QApplication::processEvents();
        print(QStringLiteral("Pressed %1; the window is %2.")
                  .arg(ok ? QStringLiteral("OK") : QStringLiteral("Cancel"),
                       dialog->isVisible() ? QStringLiteral("still open") : QStringLiteral("closed")));
    }
    if (!display || !press.isEmpty())
    {
        print(QStringLiteral("Working folder: %1").arg(host.workingFolder()));
        for (const QString& line : dialog->summary())
            print(QStringLiteral("  ") + line);
        return 0;
    }

    QObject::connect(dialog, &QDialog::finished, &application, &QCoreApplication::quit);
    return application.exec();
}
