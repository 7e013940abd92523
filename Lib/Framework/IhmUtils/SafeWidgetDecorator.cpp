#include "SafeWidgetDecorator.h"

#include "TesselLog_Static.h"

#include <QCoreApplication>
#include <QFile>
#include <QThread>
#include <QVariant>
#include <QWidget>

#include <pugixml.hpp>

#include <map>
#include <mutex>

namespace
{
const char* const kComponent = "IhmUtils";
const char* const kFile = "IhmUtils.dll";
const char* const kClass = "SafeWidgetDecorator";

std::map<QString, QString> builtInStyles()
{
    return {
        {QStringLiteral("Style84"), QStringLiteral("QDialog { background-color: #f2f2f2; }\n"
                                                   "QLabel { font-weight: bold; padding: 8px; }\n"
                                                   "QPushButton { min-width: 90px; padding: 4px 12px; }")},
        {QStringLiteral("Style85"), QStringLiteral("QDialog { background-color: #ffffff; }\n"
                                                   "QLabel { padding: 2px; }\n"
                                                   "QLineEdit { padding: 2px; border: 1px solid #9a9a9a; }\n"
                                                   "QPushButton { min-width: 90px; padding: 4px 12px; }")},
    };
}

bool onGuiThread()
{
    const QCoreApplication* application = QCoreApplication::instance();
    return application != nullptr && QThread::currentThread() == application->thread();
}
}

struct SafeWidgetDecorator::Impl
{
    mutable std::mutex mutex;
    std::map<QString, QString> styles = builtInStyles();
};

SafeWidgetDecorator::SafeWidgetDecorator() : m_impl(new Impl)
{
}

SafeWidgetDecorator::~SafeWidgetDecorator() = default;

SafeWidgetDecorator* SafeWidgetDecorator::getInstance()
{
    static SafeWidgetDecorator instance;
    return &instance;
}

bool SafeWidgetDecorator::decorate(const QString& styleName, QWidget& widget, bool recursive)
{
    if (!onGuiThread())
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, -1,
                                          "SafeWidgetDecorator::decorate: called off the GUI thread for %s",
                                          styleName.toUtf8().constData());
        return false;
    }
    const QString sheet = styleSheet(styleName);
    if (sheet.isNull())
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, -1, "SafeWidgetDecorator::decorate: no style %s",
                                          styleName.toUtf8().constData());
        return false;
    }
    // Properties first, so that selectors on them hold when the sheet polishes the widgets.
    widget.setProperty("decoratorStyle", styleName);
    if (widget.objectName().isEmpty())
        widget.setObjectName(styleName);
    if (recursive)
    {
        for (QWidget* child : widget.findChildren<QWidget*>())
            child->setProperty("decoratorStyle", styleName);
    }
    widget.setStyleSheet(sheet);
    return true;
}

bool SafeWidgetDecorator::setStyleSheetFile(const QString& path)
{
    std::map<QString, QString> styles = builtInStyles();
    if (!path.isEmpty())
    {
        pugi::xml_document document;
        const pugi::xml_parse_result parsed = document.load_file(QFile::encodeName(path).constData());
        const pugi::xml_node root = document.child("styles");
        if (!parsed || !root)
        {
            TesselLog_Static::logError_static(kComponent, kFile, kClass, -1,
                                              "SafeWidgetDecorator::setStyleSheetFile: cannot read styles from %s",
                                              path.toUtf8().constData());
            return false;
        }
        for (const pugi::xml_node style : root.children("style"))
        {
            const QString name = QString::fromUtf8(style.attribute("name").value());
            if (name.isEmpty())
                continue;
            styles[name] = QString::fromUtf8(style.child_value());
        }
    }
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    m_impl->styles.swap(styles);
    return true;
}

QString SafeWidgetDecorator::styleSheet(const QString& styleName) const
{
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    const auto found = m_impl->styles.find(styleName);
    return found == m_impl->styles.end() ? QString() : found->second;
}
