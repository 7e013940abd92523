#pragma once

#include "Export.h"

#include <QDialog>
#include <QHash>
#include <QPointer>
#include <QString>
#include <QStringList>

#include <memory>

class CDataManager;
class PDataManager;
template <class P>
class SmartProxy;
class QAbstractButton;
class QButtonGroup;
class QCheckBox;
class QComboBox;
class QGroupBox;
class QLabel;
class QLineEdit;
class QListWidget;
class QPushButton;
class QRadioButton;
class QTimeEdit;
class QTreeWidget;

// The tool-configuration window. Every control shows the record published for it at
// "data:/Auto/SystemMenu/<control name>" and follows it as it changes; a person's edits go to
// the controllers' slots, called by name through the meta-object system ("WC_TOOLCONFIGURATION"
// for the fields and buttons, "WC_USERSCOMMAND" for the users list). Widgets carry their control
// name as object name. GUI thread only; records changed on other threads arrive queued.
class TESSEL_EXPORT ToolConfigurationDialog : public QDialog
{
    Q_OBJECT

public:
    ToolConfigurationDialog(QObject* toolConfiguration, QObject* users, QWidget* parent = nullptr);
    ~ToolConfigurationDialog() override;

    // Reads every record again and shows it.
    void refreshAll();

    // Changes one field through its widget, as a person would: an edit takes the text, a check
    // box or radio button "1"/"0" (also true/false, on/off), the brand combo a label, the task
    // time "HH:mm:ss". False (with the reason in `error`) for an unknown control, a read-only
    // field or a value the widget cannot take.
    bool setFieldValue(const QString& control, const QString& value, QString* error = nullptr);

    // Clicks the named button ("OKButton", "CancelButton", ...); false when there is none.
    bool clickButton(const QString& objectName);

    // One line per group of settings, as the widgets show them.
    QStringList summary() const;

    // Lists problems for the person in the window's problems area ("ProblemsList"), errors
    // first, each with its icon; the area is hidden while there are none.
    void showProblems(const QStringList& errors, const QStringList& warnings);

    // The controls setFieldValue takes, each as "Name: what it takes", in the window's order.
    QStringList fieldControls() const;

    // Esc and the window's close box act as Cancel.
    void reject() override;

signals:
    // A button (its object name; "CancelButton" also for Esc and the close box) is about to
    // call its controller.
    void aboutToAct(const QString& button);

private:
    enum Kind
    {
        eEDIT,
        eTWO_EDIT,
        eCHECK_BOX,
        eRADIO,
        eCOMBO,
        eTIME
    };
    struct Binding
    {
        Kind kind;
        QWidget* first;
        QWidget* second;
    };
    struct ListenerGate;

    void buildWindow();
    QGroupBox* buildWorkshopGroup();
    QGroupBox* buildOnlineUpdateGroup();
    QGroupBox* buildApp2AppGroup();
    QGroupBox* buildFactsGroup();
    QLineEdit* addEdit(const QString& control, const char* slot);
    QLineEdit* addDisplayOnly(const QString& control);
    QPushButton* addButton(const QString& objectName, const QString& textId, const QString& defaultText,
                           const char* slot);
    void connectEdit(QLineEdit* edit, const char* slot);

    void listen();
    void stopListening();
    // A record under "data:/Auto/SystemMenu" changed (path without the "data:" scheme).
    void onDataChanged(const QString& path);
    void applyControl(const QString& control);
    void applyEdit(const QString& control, QLineEdit* edit);
    void applyTwoEdit(const QString& control, QLineEdit* postCode, QLineEdit* town);
    void applyCheckBox(const QString& control, QAbstractButton* button);
    void applyCombo(const QString& control, QComboBox* combo);
    void applyTime(const QString& control, QTimeEdit* edit);
    void applyUsers();
    void applyState(QLineEdit* edit, long state);
    void setTextQuietly(QLineEdit* edit, const QString& text);

    // Calls a slot of a controller by its signature, e.g. "onNameChanged(QString)".
    void callTool(const char* signature, const QString* first = nullptr, const QString* second = nullptr);
    void callToolBool(const char* signature, bool value);
    void callUsers(const char* signature, bool withSelectedItem);
    bool invoke(QObject* target, const char* signature, QGenericArgument first = QGenericArgument(),
                QGenericArgument second = QGenericArgument());

    static QString text(const QString& textId, const QString& defaultText);

    std::unique_ptr<SmartProxy<PDataManager>> m_dataManager;
    QPointer<QObject> m_toolConfiguration;
    QPointer<QObject> m_users;
    QHash<QString, Binding> m_bindings;
    // True while a record is being shown: widget signals then stay away from the controllers.
    bool m_applying;
    // True while a controller's slot runs: a close it asks for is not taken as Cancel.
    bool m_callingController;
    QButtonGroup* m_modeGroup;
    QPushButton* m_browseButton;
    QTreeWidget* m_usersList;
    QLabel* m_problemsTitle;
    QListWidget* m_problemsList;
    std::shared_ptr<ListenerGate> m_gate;
    int m_listenerHandle;
    // The data manager the listener was added to (observer: it may be gone at destruction).
    CDataManager* m_listenedDataManager;
};
