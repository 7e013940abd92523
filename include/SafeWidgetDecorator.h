#pragma once

#include "Export.h"

#include <QString>

#include <memory>

class QWidget;

// Applies named styles to widgets. A style is a Qt style sheet; the built-in ones ("Style84"
// for wait dialogs, "Style85" for result and edit dialogs) can be replaced or extended from an
// XML file:  <styles><style name="Style84">QDialog { ... }</style>...</styles>
// Widgets are only touched on the thread of the application object.
class TESSEL_EXPORT SafeWidgetDecorator
{
public:
    // The process's decorator; never null.
    static SafeWidgetDecorator* getInstance();

    virtual ~SafeWidgetDecorator();

    // Gives `widget` the style sheet of `styleName` and the property "decoratorStyle" (and the
    // object name styleName when it has none); with `recursive`, every child widget gets the
    // property too. False, widget untouched, for an unknown style or off the GUI thread.
    virtual bool decorate(const QString& styleName, QWidget& widget, bool recursive);

    // Loads styles from the XML file; names found there replace the built-in ones. False, styles
    // unchanged, when the file cannot be read. An empty path goes back to the built-in styles.
    virtual bool setStyleSheetFile(const QString& path);

    // The style sheet of `styleName`, or a null string when there is no such style.
    QString styleSheet(const QString& styleName) const;

private:
    SafeWidgetDecorator();
    SafeWidgetDecorator(const SafeWidgetDecorator&) = delete;
    SafeWidgetDecorator& operator=(const SafeWidgetDecorator&) = delete;

    struct Impl;
    std::unique_ptr<Impl> m_impl;
};
