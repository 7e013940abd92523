#include "ToolConfigurationDialog.h"

#include "BBool.h"
#include "BSet.h"
#include "BString.h"
#include "CDataManager.h"
#include "ComponentManagerFactory.h"
#include "DialogTexts.h"
#include "ID.h"
#include "PDataManager.h"
#include "QListViewItem.h"
#include "SmartProxy.h"
#include "TesselLog_Static.h"
#include "WideString.h"

#include <QApplication>
#include <QButtonGroup>
#include <QCheckBox>
#include <QComboBox>
#include <QFormLayout>
#include <QGridLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QHeaderView>
#include <QLabel>
#include <QLineEdit>
#include <QListWidget>
#include <QMetaMethod>
#include <QPushButton>
#include <QRadioButton>
#include <QStyle>
#include <QThread>
#include <QTime>
#include <QTimeEdit>
#include <QTreeWidget>
#include <QVBoxLayout>

#include <algorithm>
#include <mutex>
#include <utility>

namespace
{
const char* const kComponent = "GuiToolConfiguration";
const char* const kFile = "GuiToolConfiguration.dll";
const char* const kClass = "ToolConfigurationDialog";

const char* const kControlRoot = "/Auto/SystemMenu";
const char* const kUsersControl = "Users";
const wchar_t* const kUserSetUri = L"data:/Auto/SystemMenu/Users/UserSet";
const char* const kTimeFormat = "HH:mm:ss";
const long kStateEditable = 3;

QString toQString(const ACE_WString& text)
{
    return QString::fromWCharArray(text.c_str(), static_cast<qsizetype>(text.length()));
}

ACE_WString toWide(const QString& text)
{
    const std::wstring wide = text.toStdWString();
    return ACE_WString(wide.c_str(), wide.size());
}

ID controlUri(const QString& control)
{
    return ID(toWide(QStringLiteral("data:") + QLatin1String(kControlRoot) + QLatin1Char('/') + control));
}

// "1", "true", "on", "yes" and their opposites; false when the text is neither.
bool parseBool(const QString& text, bool& value)
{
    const QString lowered = text.trimmed().toLower();
    if (lowered == QLatin1String("1") || lowered == QLatin1String("true") || lowered == QLatin1String("on") ||
        lowered == QLatin1String("yes"))
    {
        value = true;
        return true;
    }
    if (lowered == QLatin1String("0") || lowered == QLatin1String("false") || lowered == QLatin1String("off") ||
        lowered == QLatin1String("no"))
    {
        value = false;
        return true;
    }
    return false;
}

// Sets a flag for the lifetime of the object, then puts the old value back.
class FlagScope
{
public:
    explicit FlagScope(bool& flag) : m_flag(flag), m_old(flag) { m_flag = true; }
    ~FlagScope() { m_flag = m_old; }
    FlagScope(const FlagScope&) = delete;
    FlagScope& operator=(const FlagScope&) = delete;

private:
    bool& m_flag;
    bool m_old;
};
}

// Shared with the data manager's listener: cleared when the dialog goes, so that a change
// reported on another thread at that moment is dropped instead of reaching a dead dialog.
struct ToolConfigurationDialog::ListenerGate
{
    std::mutex mutex;
    ToolConfigurationDialog* dialog = nullptr;
};

ToolConfigurationDialog::ToolConfigurationDialog(QObject* toolConfiguration, QObject* users, QWidget* parent)
    : QDialog(parent),
      m_dataManager(std::make_unique<SmartProxy<PDataManager>>()),
      m_toolConfiguration(toolConfiguration),
      m_users(users),
      m_applying(false),
      m_callingController(false),
      m_modeGroup(nullptr),
      m_browseButton(nullptr),
      m_usersList(nullptr),
      m_problemsTitle(nullptr),
      m_problemsList(nullptr),
      m_gate(std::make_shared<ListenerGate>()),
      m_listenerHandle(0),
      m_listenedDataManager(nullptr)
{
    setObjectName(QStringLiteral("ToolConfigurationDialog"));
    m_dataManager->acquire(ID(CDataManager::componentID));
    buildWindow();
    refreshAll();
    listen();
}

ToolConfigurationDialog::~ToolConfigurationDialog()
{
    stopListening();
}

QString ToolConfigurationDialog::text(const QString& textId, const QString& defaultText)
{
    return DialogTexts::text(QStringLiteral("ToolConfiguration/") + textId, defaultText);
}

// ---------------------------------------------------------------------------------------------
// Window

void ToolConfigurationDialog::buildWindow()
{
    setWindowTitle(text(QStringLiteral("Title"), QStringLiteral("Tool configuration")));

    auto* groups = new QGridLayout();
    groups->setHorizontalSpacing(12);
    groups->setVerticalSpacing(10);
    groups->addWidget(buildWorkshopGroup(), 0, 0);
    groups->addWidget(buildApp2AppGroup(), 1, 0);
    groups->addWidget(buildOnlineUpdateGroup(), 0, 1);
    groups->addWidget(buildFactsGroup(), 1, 1);
    groups->setColumnStretch(0, 1);
    groups->setColumnStretch(1, 1);

    auto* recordingMode =
        new QCheckBox(text(QStringLiteral("RecordingMode"), QStringLiteral("Recording mode (detailed log)")), this);
    recordingMode->setObjectName(QStringLiteral("ASRMChk"));
    m_bindings.insert(recordingMode->objectName(), {eCHECK_BOX, recordingMode, nullptr});
    connect(recordingMode, &QCheckBox::toggled, this,
            [this](bool checked) { callToolBool("onRecordingModeChecked(bool)", checked); });

    auto* buttons = new QHBoxLayout();
    buttons->addWidget(recordingMode);
    buttons->addWidget(addButton(QStringLiteral("SaveLogsButton"), QStringLiteral("SaveLogs"),
                                 QStringLiteral("Save logs..."), "onButtonSaveLogsClicked()"));
    buttons->addStretch();
    QPushButton* ok =
        addButton(QStringLiteral("OKButton"), QStringLiteral("OK"), QStringLiteral("OK"), "onOKButtonClicked()");
    ok->setDefault(true);
    buttons->addWidget(ok);
    buttons->addWidget(addButton(QStringLiteral("CancelButton"), QStringLiteral("Cancel"), QStringLiteral("Cancel"),
                                 "onCancelButtonClicked()"));

    m_problemsTitle = new QLabel(text(QStringLiteral("Problems"), QStringLiteral("Problems")), this);
    m_problemsTitle->setObjectName(QStringLiteral("ProblemsTitle"));
    m_problemsList = new QListWidget(this);
    m_problemsList->setObjectName(QStringLiteral("ProblemsList"));
    m_problemsList->setWordWrap(true);
    m_problemsList->setMaximumHeight(90);
    m_problemsTitle->hide();
    m_problemsList->hide();

    auto* layout = new QVBoxLayout(this);
    layout->setContentsMargins(14, 14, 14, 12);
    layout->setSpacing(12);
    layout->addLayout(groups);
    layout->addWidget(m_problemsTitle);
    layout->addWidget(m_problemsList);
    layout->addLayout(buttons);
    setMinimumWidth(940);
}

QGroupBox* ToolConfigurationDialog::buildWorkshopGroup()
{
    auto* group = new QGroupBox(text(QStringLiteral("Workshop"), QStringLiteral("Workshop")), this);
    auto* form = new QFormLayout(group);
    form->addRow(text(QStringLiteral("BusinessNumber"), QStringLiteral("Business number")),
                 addEdit(QStringLiteral("ProjectNumberEdit"), "onProjectNumberChanged(QString)"));
    form->addRow(text(QStringLiteral("CompanyName"), QStringLiteral("Company name")),
                 addEdit(QStringLiteral("CompanyNameEdit"), "onCompanyNameChanged(QString)"));
    form->addRow(text(QStringLiteral("Name"), QStringLiteral("Name")),
                 addEdit(QStringLiteral("NameEdit"), "onNameChanged(QString)"));
    form->addRow(text(QStringLiteral("Street"), QStringLiteral("Street")),
                 addEdit(QStringLiteral("StreetEdit"), "onStreetChanged(QString)"));

    auto* postCode = new QLineEdit(group);
    postCode->setObjectName(QStringLiteral("TownPostCodeEdit_PostCode"));
    postCode->setMaximumWidth(90);
    auto* town = new QLineEdit(group);
    town->setObjectName(QStringLiteral("TownPostCodeEdit_Town"));
    m_bindings.insert(QStringLiteral("TownPostCodeEdit"), {eTWO_EDIT, postCode, town});
    auto townOrPostCodeChanged = [this, postCode, town]() {
        const QString postCodeText = postCode->text();
        const QString townText = town->text();
        callTool("onTownOrPostCodeChanged(QString,QString)", &postCodeText, &townText);
    };
    connect(postCode, &QLineEdit::textChanged, this, townOrPostCodeChanged);
    connect(town, &QLineEdit::textChanged, this, townOrPostCodeChanged);
    auto* postCodeAndTown = new QHBoxLayout();
    postCodeAndTown->addWidget(postCode);
    postCodeAndTown->addWidget(town, 1);
    form->addRow(text(QStringLiteral("PostCodeTown"), QStringLiteral("Post code, town")), postCodeAndTown);

    form->addRow(text(QStringLiteral("Telephone"), QStringLiteral("Telephone")),
                 addEdit(QStringLiteral("PhoneNumberEdit"), "onPhoneNumberChanged(QString)"));
    form->addRow(text(QStringLiteral("Fax"), QStringLiteral("Fax")),
                 addEdit(QStringLiteral("FaxNumberEdit"), "onFaxNumberChanged(QString)"));

    auto* brand = new QComboBox(group);
    brand->setObjectName(QStringLiteral("BrandCombo"));
    m_bindings.insert(brand->objectName(), {eCOMBO, brand, nullptr});
    connect(brand, &QComboBox::currentIndexChanged, this, [this, brand](int index) {
        if (index < 0)
            return;
        const QString label = brand->itemText(index);
        callTool("onManufacturerChanged(QString)", &label);
    });
    form->addRow(text(QStringLiteral("DefaultBrand"), QStringLiteral("Default brand")), brand);
    return group;
}

QGroupBox* ToolConfigurationDialog::buildOnlineUpdateGroup()
{
    auto* group = new QGroupBox(text(QStringLiteral("OnlineUpdate"), QStringLiteral("Online update")), this);
    auto* form = new QFormLayout(group);

    auto* activated =
        new QCheckBox(text(QStringLiteral("CheckInternet"), QStringLiteral("Activate online updates")), group);
    activated->setObjectName(QStringLiteral("CheckInternet"));
    m_bindings.insert(activated->objectName(), {eCHECK_BOX, activated, nullptr});
    connect(activated, &QCheckBox::toggled, this,
            [this](bool checked) { callToolBool("onCheckInternetChecked(bool)", checked); });
    form->addRow(activated);

    m_modeGroup = new QButtonGroup(this);
    auto* modes = new QVBoxLayout();
    modes->setSpacing(2);
    const struct
    {
        const char* control;
        const char* textId;
        const char* defaultText;
        const char* slot;
    } radios[] = {
        {"LocalRadioButton", "ModeLocal", "Local repository", "onLocalRadioButtonClicked()"},
        {"A2ARadioButton", "ModeA2A", "App2App server share", "onA2ARadioButtonClicked()"},
        {"OtherRadioButton", "ModeOther", "Other folder", "onOtherRadioButtonClicked()"},
    };
    for (const auto& radio : radios)
    {
        auto* button = new QRadioButton(text(QLatin1String(radio.textId), QLatin1String(radio.defaultText)), group);
        button->setObjectName(QLatin1String(radio.control));
        m_modeGroup->addButton(button);
        modes->addWidget(button);
        m_bindings.insert(button->objectName(), {eRADIO, button, nullptr});
        const char* slot = radio.slot;
        connect(button, &QRadioButton::clicked, this, [this, slot]() { callTool(slot); });
    }
    form->addRow(text(QStringLiteral("DeploymentMode"), QStringLiteral("Packages from")), modes);

    QLineEdit* folder = addEdit(QStringLiteral("DistributionFolderPath"), "onDistributionFolderPathChanged(QString)");
    m_browseButton = addButton(QStringLiteral("FolderBrowserButton"), QStringLiteral("Browse"),
                               QStringLiteral("Browse..."), "onFolderBrowserButtonClicked()");
    auto* folderRow = new QHBoxLayout();
    folderRow->addWidget(folder, 1);
    folderRow->addWidget(m_browseButton);
    form->addRow(text(QStringLiteral("DistributionFolder"), QStringLiteral("Distribution folder")), folderRow);

    auto* time = new QTimeEdit(group);
    time->setObjectName(QStringLiteral("TaskTimeEdit"));
    time->setDisplayFormat(QLatin1String(kTimeFormat));
    m_bindings.insert(time->objectName(), {eTIME, time, nullptr});
    connect(time, &QTimeEdit::timeChanged, this, [this](QTime value) {
        if (m_applying)
            return;
        invoke(m_toolConfiguration, "onTaskTimeEditChanged(QTime)", Q_ARG(QTime, value));
    });
    auto* timeRow = new QHBoxLayout();
    timeRow->addWidget(time);
    timeRow->addStretch();
    form->addRow(text(QStringLiteral("TaskTime"), QStringLiteral("Daily update at")), timeRow);

    auto* testRow = new QHBoxLayout();
    testRow->addStretch();
    testRow->addWidget(addButton(QStringLiteral("ConfigurationTestButton"), QStringLiteral("ConfigurationTest"),
                                 QStringLiteral("Test configuration"), "onConfigurationTestButtonClicked()"));
    form->addRow(testRow);
    return group;
}

QGroupBox* ToolConfigurationDialog::buildApp2AppGroup()
{
    auto* group = new QGroupBox(text(QStringLiteral("App2AppAndUsers"), QStringLiteral("App2App and users")), this);
    auto* layout = new QVBoxLayout(group);
    auto* form = new QFormLayout();
    form->addRow(text(QStringLiteral("App2AppIP"), QStringLiteral("Server address")),
                 addEdit(QStringLiteral("App2AppIP"), "onIPAddressChanged(QString)"));
    form->addRow(text(QStringLiteral("App2AppPort"), QStringLiteral("Port")),
                 addEdit(QStringLiteral("App2AppPort"), "onPortChanged(QString)"));
    form->addRow(text(QStringLiteral("App2AppDealerID"), QStringLiteral("Dealer ID")),
                 addEdit(QStringLiteral("App2AppDealerID"), "onDealerIDChanged(QString)"));
    layout->addLayout(form);

    m_usersList = new QTreeWidget(group);
    m_usersList->setObjectName(QStringLiteral("UsersList"));
    m_usersList->setColumnCount(3);
    m_usersList->setHeaderLabels({text(QStringLiteral("UserName"), QStringLiteral("Name")),
                                  text(QStringLiteral("UserAddress"), QStringLiteral("Address")),
                                  text(QStringLiteral("UserTelephone"), QStringLiteral("Telephone"))});
    m_usersList->setRootIsDecorated(false);
    m_usersList->setUniformRowHeights(true);
    m_usersList->setAlternatingRowColors(true);
    m_usersList->setSelectionMode(QAbstractItemView::SingleSelection);
    // Every column as wide as its contents; the list scrolls sideways when they do not fit.
    m_usersList->header()->setStretchLastSection(false);
    m_usersList->header()->setSectionResizeMode(QHeaderView::ResizeToContents);
    m_usersList->setMinimumHeight(110);

    QPushButton* add =
        addButton(QStringLiteral("UsersAddButton"), QStringLiteral("UserAdd"), QStringLiteral("Add..."), nullptr);
    QPushButton* modify = addButton(QStringLiteral("UsersModifyButton"), QStringLiteral("UserModify"),
                                    QStringLiteral("Modify..."), nullptr);
    QPushButton* remove =
        addButton(QStringLiteral("UsersDeleteButton"), QStringLiteral("UserDelete"), QStringLiteral("Delete"), nullptr);
    connect(add, &QPushButton::clicked, this, [this]() { callUsers("onAddClicked()", false); });
    connect(modify, &QPushButton::clicked, this,
            [this]() { callUsers("onModifyClicked(const QListViewItem*)", true); });
    connect(remove, &QPushButton::clicked, this,
            [this]() { callUsers("onDeleteClicked(const QListViewItem*)", true); });
    connect(m_usersList, &QTreeWidget::itemDoubleClicked, this,
            [this]() { callUsers("onModifyClicked(const QListViewItem*)", true); });
    auto selectionChanged = [this, modify, remove]() {
        const bool selected = m_usersList->currentItem() != nullptr && !m_usersList->selectedItems().isEmpty();
        modify->setEnabled(selected);
        remove->setEnabled(selected);
    };
    connect(m_usersList, &QTreeWidget::itemSelectionChanged, this, selectionChanged);
    selectionChanged();

    auto* userButtons = new QVBoxLayout();
    userButtons->addWidget(add);
    userButtons->addWidget(modify);
    userButtons->addWidget(remove);
    userButtons->addStretch();
    auto* users = new QHBoxLayout();
    users->addWidget(m_usersList, 1);
    users->addLayout(userButtons);
    layout->addWidget(new QLabel(text(QStringLiteral("Users"), QStringLiteral("Users")), group));
    layout->addLayout(users, 1);
    return group;
}

QGroupBox* ToolConfigurationDialog::buildFactsGroup()
{
    auto* group = new QGroupBox(text(QStringLiteral("InstallationFacts"), QStringLiteral("Installation facts")), this);
    auto* form = new QFormLayout(group);
    const struct
    {
        const char* control;
        const char* defaultText;
    } facts[] = {
        {"Country", "Country"},
        {"Language", "Language"},
        {"SerialNo", "Version"},
        {"HFconnection", "HF connection"},
        {"IPaddress", "Network"},
        {"Navigator1", "Browser 1"},
        {"Navigator2", "Browser 2"},
        {"DiagURL", "Diagnostic URL"},
        {"TargetURL", "Target URL"},
        {"OrbisURL", "Orbis URL"},
        {"FaultServer", "Fault report server"},
        {"SMTPServer", "SMTP server"},
    };
    for (const auto& fact : facts)
        form->addRow(text(QLatin1String(fact.control), QLatin1String(fact.defaultText)),
                     addDisplayOnly(QLatin1String(fact.control)));
    return group;
}

QLineEdit* ToolConfigurationDialog::addEdit(const QString& control, const char* slot)
{
    auto* edit = new QLineEdit(this);
    edit->setObjectName(control);
    m_bindings.insert(control, {eEDIT, edit, nullptr});
    connectEdit(edit, slot);
    return edit;
}

QLineEdit* ToolConfigurationDialog::addDisplayOnly(const QString& control)
{
    auto* edit = new QLineEdit(this);
    edit->setObjectName(control);
    edit->setReadOnly(true);
    edit->setFocusPolicy(Qt::NoFocus);
    m_bindings.insert(control, {eEDIT, edit, nullptr});
    applyState(edit, 19);
    return edit;
}

QPushButton* ToolConfigurationDialog::addButton(const QString& objectName, const QString& textId,
                                                const QString& defaultText, const char* slot)
{
    auto* button = new QPushButton(text(textId, defaultText), this);
    button->setObjectName(objectName);
    button->setAutoDefault(false);
    if (slot != nullptr)
        connect(button, &QPushButton::clicked, this, [this, objectName, slot]() {
            emit aboutToAct(objectName);
            callTool(slot);
        });
    return button;
}

void ToolConfigurationDialog::connectEdit(QLineEdit* edit, const char* slot)
{
    connect(edit, &QLineEdit::textChanged, this, [this, slot](const QString& value) { callTool(slot, &value); });
}

// ---------------------------------------------------------------------------------------------
// Records -> widgets

void ToolConfigurationDialog::listen()
{
    m_gate->dialog = this;
    IComponentManager* manager = ComponentManagerFactory::getComponentManager();
    if (manager == nullptr)
        return;
    const ID id(CDataManager::componentID);
    if (manager->hasComponent(id))
        m_listenedDataManager = dynamic_cast<CDataManager*>(manager->getComponent(id));
    manager->release();
    if (m_listenedDataManager == nullptr)
    {
        TesselLog_Static::logWarning_static(kComponent, kFile, kClass,
                                            L"[ToolConfigurationDialog::listen] : no data manager to follow");
        return;
    }
    std::weak_ptr<ListenerGate> weakGate = m_gate;
    m_listenerHandle = m_listenedDataManager->addListener([weakGate](const ID& uri) {
        const std::shared_ptr<ListenerGate> gate = weakGate.lock();
        if (!gate)
            return;
        const QString path = toQString(uri.getPath());
        ToolConfigurationDialog* dialog = nullptr;
        {
            std::lock_guard<std::mutex> lock(gate->mutex);
            dialog = gate->dialog;
            if (dialog == nullptr)
                return;
            if (QThread::currentThread() != dialog->thread())
            {
                // Delivered on the GUI thread; dropped by Qt if the dialog is gone by then.
                QMetaObject::invokeMethod(
                    dialog, [dialog, path]() { dialog->onDataChanged(path); }, Qt::QueuedConnection);
                return;
            }
        }
        dialog->onDataChanged(path);
    });
}

void ToolConfigurationDialog::stopListening()
{
    {
        std::lock_guard<std::mutex> lock(m_gate->mutex);
        m_gate->dialog = nullptr;
    }
    if (m_listenerHandle == 0 || m_listenedDataManager == nullptr)
        return;
    // The data manager may have been destroyed before the dialog: only a live one is told.
    IComponentManager* manager = ComponentManagerFactory::getComponentManager();
    if (manager == nullptr)
        return;
    const ID id(CDataManager::componentID);
    if (manager->hasComponent(id) && manager->getComponent(id) == m_listenedDataManager)
        m_listenedDataManager->removeListener(m_listenerHandle);
    manager->release();
    m_listenerHandle = 0;
    m_listenedDataManager = nullptr;
}

void ToolConfigurationDialog::onDataChanged(const QString& path)
{
    const QString root = QLatin1String(kControlRoot);
    if (path.isEmpty() || path == QLatin1String("/") || path == root || root.startsWith(path + QLatin1Char('/')))
    {
        refreshAll();
        return;
    }
    if (!path.startsWith(root + QLatin1Char('/')))
        return;
    const QString control = path.mid(root.size() + 1).section(QLatin1Char('/'), 0, 0);
    if (control == QLatin1String(kUsersControl))
        applyUsers();
    else
        applyControl(control);
}

void ToolConfigurationDialog::refreshAll()
{
    for (auto it = m_bindings.constBegin(); it != m_bindings.constEnd(); ++it)
        applyControl(it.key());
    applyUsers();
}

void ToolConfigurationDialog::applyControl(const QString& control)
{
    const auto found = m_bindings.constFind(control);
    if (found == m_bindings.constEnd())
        return;
    const Binding& binding = found.value();
    switch (binding.kind)
    {
    case eEDIT:
        applyEdit(control, static_cast<QLineEdit*>(binding.first));
        break;
    case eTWO_EDIT:
        applyTwoEdit(control, static_cast<QLineEdit*>(binding.first), static_cast<QLineEdit*>(binding.second));
        break;
    case eCHECK_BOX:
    case eRADIO:
        applyCheckBox(control, static_cast<QAbstractButton*>(binding.first));
        break;
    case eCOMBO:
        applyCombo(control, static_cast<QComboBox*>(binding.first));
        break;
    case eTIME:
        applyTime(control, static_cast<QTimeEdit*>(binding.first));
        break;
    }
}

void ToolConfigurationDialog::applyEdit(const QString& control, QLineEdit* edit)
{
    if (!m_dataManager->isAvailable())
        return;
    BSet record;
    if ((*m_dataManager)->getData(controlUri(control), record) != 0)
    {
        // A plain text is shown as it is, editable.
        BString plain;
        if ((*m_dataManager)->getData(controlUri(control), plain) == 0)
        {
            setTextQuietly(edit, toQString(plain.value()));
            applyState(edit, kStateEditable);
        }
        return;
    }
    long state = kStateEditable;
    record.getInt(L"state", state);
    BSet value;
    ACE_WString item;
    if (record.getSet(L"value", value) == 0)
        value.getString(L"item", item);
    setTextQuietly(edit, toQString(item));
    applyState(edit, state);
    if (control == QLatin1String("DistributionFolderPath") && m_browseButton != nullptr)
        m_browseButton->setEnabled(state == kStateEditable);
}

void ToolConfigurationDialog::applyTwoEdit(const QString& control, QLineEdit* postCode, QLineEdit* town)
{
    if (!m_dataManager->isAvailable())
        return;
    BSet record;
    if ((*m_dataManager)->getData(controlUri(control), record) != 0)
        return;
    long state = kStateEditable;
    record.getInt(L"state", state);
    ACE_WString first;
    ACE_WString second;
    record.getString(L"edit1", first);
    record.getString(L"edit2", second);
    setTextQuietly(postCode, toQString(first));
    setTextQuietly(town, toQString(second));
    applyState(postCode, state);
    applyState(town, state);
}

void ToolConfigurationDialog::applyCheckBox(const QString& control, QAbstractButton* button)
{
    if (!m_dataManager->isAvailable())
        return;
    bool checked = false;
    if ((*m_dataManager)->getBool(controlUri(control), checked) != 0 || button->isChecked() == checked)
        return;
    FlagScope applying(m_applying);
    QButtonGroup* group = button->group();
    // An exclusive group never lets its checked button go by itself.
    const bool exclusive = group != nullptr && group->exclusive();
    if (exclusive && !checked)
        group->setExclusive(false);
    button->setChecked(checked);
    if (exclusive && !checked)
        group->setExclusive(true);
}

void ToolConfigurationDialog::applyCombo(const QString& control, QComboBox* combo)
{
    if (!m_dataManager->isAvailable())
        return;
    BSet record;
    if ((*m_dataManager)->getData(controlUri(control), record) != 0)
        return;
    BSet items;
    record.getSet(L"value", items);
    ACE_WString selected;
    record.getString(L"selected", selected);

    std::vector<std::pair<QString, QString>> entries;
    for (int i = 0; i < items.size(); ++i)
    {
        const BData& item = items.valueAt(i);
        const QString label =
            item.type() == BData::eSTRING ? toQString(static_cast<const BString&>(item).value()) : QString();
        entries.emplace_back(toQString(items.keyAt(i)), label);
    }
    std::sort(entries.begin(), entries.end());

    FlagScope applying(m_applying);
    combo->clear();
    for (const auto& [key, label] : entries)
        combo->addItem(label, key);
    combo->setCurrentIndex(combo->findText(toQString(selected), Qt::MatchExactly));
    long state = kStateEditable;
    record.getInt(L"state", state);
    combo->setEnabled(state == kStateEditable);
}

void ToolConfigurationDialog::applyTime(const QString& control, QTimeEdit* edit)
{
    if (!m_dataManager->isAvailable())
        return;
    ACE_WString value;
    if ((*m_dataManager)->getString(controlUri(control), value) != 0)
        return;
    const QTime time = QTime::fromString(toQString(value), QLatin1String(kTimeFormat));
    if (!time.isValid() || time == edit->time())
        return;
    FlagScope applying(m_applying);
    edit->setTime(time);
}

void ToolConfigurationDialog::applyUsers()
{
    if (!m_dataManager->isAvailable() || m_usersList == nullptr)
        return;
    BSet users;
    if ((*m_dataManager)->getData(ID(kUserSetUri), users) != 0)
        users.clear();
    const QTreeWidgetItem* current = m_usersList->currentItem();
    const QString selectedName = current != nullptr ? current->text(0) : QString();

    FlagScope applying(m_applying);
    m_usersList->clear();
    QTreeWidgetItem* reselect = nullptr;
    for (int i = 0; i < users.size(); ++i)
    {
        BSet user;
        if (users.getSet(WideString::fromUtf8("User#" + std::to_string(i)), user) != 0)
            continue;
        ACE_WString name;
        ACE_WString address;
        ACE_WString phone;
        user.getString(L"name", name);
        user.getString(L"address", address);
        user.getString(L"phone", phone);
        auto* item = new QTreeWidgetItem(m_usersList, {toQString(name), toQString(address), toQString(phone)});
        if (reselect == nullptr && !selectedName.isEmpty() && item->text(0) == selectedName)
            reselect = item;
    }
    if (reselect != nullptr)
    {
        m_usersList->setCurrentItem(reselect);
        reselect->setSelected(true);
    }
}

void ToolConfigurationDialog::applyState(QLineEdit* edit, long state)
{
    // 3: the person edits it; 2: the update mode fixes it; 19: display only.
    const bool readOnly = state != kStateEditable;
    edit->setReadOnly(readOnly);
    edit->setProperty("state", static_cast<int>(state));
    QPalette palette = edit->palette();
    const QPalette standard = QApplication::palette(edit);
    palette.setColor(QPalette::Base, readOnly ? standard.color(QPalette::Window) : standard.color(QPalette::Base));
    edit->setPalette(palette);
}

void ToolConfigurationDialog::setTextQuietly(QLineEdit* edit, const QString& text)
{
    if (edit->text() == text)
        return;
    FlagScope applying(m_applying);
    const int cursor = edit->cursorPosition();
    edit->setText(text);
    edit->setCursorPosition(std::min(cursor, static_cast<int>(text.size())));
    if (edit->isReadOnly())
        edit->setCursorPosition(0);
}

// ---------------------------------------------------------------------------------------------
// Widgets -> controllers

bool ToolConfigurationDialog::invoke(QObject* target, const char* signature, QGenericArgument first,
                                     QGenericArgument second)
{
    if (target == nullptr)
        return false;
    const QByteArray normalized = QMetaObject::normalizedSignature(signature);
    const int index = target->metaObject()->indexOfSlot(normalized.constData());
    if (index < 0)
    {
        TesselLog_Static::logWarning_static(kComponent, kFile, kClass,
                                            WideString::fromUtf8("[ToolConfigurationDialog::invoke] : " +
                                                                 std::string(target->metaObject()->className()) +
                                                                 " has no slot " + normalized.toStdString())
                                                .c_str());
        return false;
    }
    const QMetaMethod method = target->metaObject()->method(index);
    QPointer<ToolConfigurationDialog> self(this);
    const bool old = m_callingController;
    m_callingController = true;
    const bool invoked = method.invoke(target, Qt::DirectConnection, first, second);
    if (self)
        m_callingController = old;
    return invoked;
}

void ToolConfigurationDialog::callTool(const char* signature, const QString* first, const QString* second)
{
    if (m_applying)
        return;
    if (first == nullptr)
        invoke(m_toolConfiguration, signature);
    else if (second == nullptr)
        invoke(m_toolConfiguration, signature, Q_ARG(QString, *first));
    else
        invoke(m_toolConfiguration, signature, Q_ARG(QString, *first), Q_ARG(QString, *second));
}

void ToolConfigurationDialog::callToolBool(const char* signature, bool value)
{
    if (m_applying)
        return;
    invoke(m_toolConfiguration, signature, Q_ARG(bool, value));
}

void ToolConfigurationDialog::callUsers(const char* signature, bool withSelectedItem)
{
    if (m_applying)
        return;
    if (!withSelectedItem)
    {
        invoke(m_users, signature);
        return;
    }
    const QTreeWidgetItem* row = m_usersList->currentItem();
    if (row == nullptr)
        return;
    // The controller reads the row's columns; it gets its own copy, so a list rebuilt while its
    // dialogs are open does not pull the row from under it.
    const QListViewItem item(row->text(0), row->text(1), row->text(2));
    const QListViewItem* pointer = &item;
    invoke(m_users, signature, Q_ARG(const QListViewItem*, pointer));
}

void ToolConfigurationDialog::reject()
{
    if (m_callingController || m_toolConfiguration.isNull())
    {
        QDialog::reject();
        return;
    }
    QPointer<ToolConfigurationDialog> self(this);
    emit aboutToAct(QStringLiteral("CancelButton"));
    if (!self)
        return;
    callTool("onCancelButtonClicked()");
    // The person asked to close the window: it goes even when no mediator closed it.
    if (self && isVisible())
        QDialog::reject();
}

bool ToolConfigurationDialog::clickButton(const QString& objectName)
{
    auto* button = findChild<QAbstractButton*>(objectName);
    if (button == nullptr || !button->isEnabled())
        return false;
    button->click();
    return true;
}

bool ToolConfigurationDialog::setFieldValue(const QString& control, const QString& value, QString* error)
{
    auto fail = [error](const QString& reason) {
        if (error != nullptr)
            *error = reason;
        return false;
    };
    QWidget* widget = findChild<QWidget*>(control);
    if (widget == nullptr)
        return fail(QStringLiteral("no control named %1").arg(control));
    if (!widget->isEnabled())
        return fail(QStringLiteral("%1 is disabled").arg(control));
    if (auto* edit = qobject_cast<QLineEdit*>(widget))
    {
        if (edit->isReadOnly())
            return fail(QStringLiteral("%1 is read-only").arg(control));
        edit->setText(value);
        return true;
    }
    if (auto* radio = qobject_cast<QRadioButton*>(widget))
    {
        bool on = false;
        if (!parseBool(value, on) || !on)
            return fail(QStringLiteral("%1 is chosen with the value 1").arg(control));
        radio->click();
        return true;
    }
    if (auto* check = qobject_cast<QCheckBox*>(widget))
    {
        bool on = false;
        if (!parseBool(value, on))
            return fail(QStringLiteral("%1 takes 1 or 0, not '%2'").arg(control, value));
        check->setChecked(on);
        return true;
    }
    if (auto* combo = qobject_cast<QComboBox*>(widget))
    {
        int index = combo->findText(value, Qt::MatchFixedString);
        if (index < 0)
            index = combo->findData(value);
        if (index < 0)
            return fail(QStringLiteral("%1 has no item '%2'").arg(control, value));
        combo->setCurrentIndex(index);
        return true;
    }
    if (auto* time = qobject_cast<QTimeEdit*>(widget))
    {
        QTime parsed = QTime::fromString(value, QLatin1String(kTimeFormat));
        if (!parsed.isValid())
            parsed = QTime::fromString(value, QStringLiteral("HH:mm"));
        if (!parsed.isValid())
            return fail(QStringLiteral("%1 takes a time HH:mm:ss, not '%2'").arg(control, value));
        time->setTime(parsed);
        return true;
    }
    return fail(QStringLiteral("%1 cannot be set").arg(control));
}

QStringList ToolConfigurationDialog::summary() const
{
    auto field = [this](const char* name) {
        const auto* edit = findChild<const QLineEdit*>(QLatin1String(name));
        return edit != nullptr ? edit->text() : QString();
    };
    auto checked = [this](const char* name) {
        const auto* button = findChild<const QAbstractButton*>(QLatin1String(name));
        return button != nullptr && button->isChecked();
    };
    QString mode = QStringLiteral("none");
    if (checked("LocalRadioButton"))
        mode = QStringLiteral("LOCAL");
    else if (checked("A2ARadioButton"))
        mode = QStringLiteral("A2A");
    else if (checked("OtherRadioButton"))
        mode = QStringLiteral("OTHER");
    const auto* brand = findChild<const QComboBox*>(QStringLiteral("BrandCombo"));
    const auto* time = findChild<const QTimeEdit*>(QStringLiteral("TaskTimeEdit"));
    const auto* folder = findChild<const QLineEdit*>(QStringLiteral("DistributionFolderPath"));

    QStringList names;
    for (int i = 0; m_usersList != nullptr && i < m_usersList->topLevelItemCount(); ++i)
        names << m_usersList->topLevelItem(i)->text(0);

    QStringList lines;
    lines << QStringLiteral("Workshop: %1 | %2 | %3 | %4 %5 | tel %6 | fax %7 | business number %8 | brand %9")
                 .arg(field("CompanyNameEdit"), field("NameEdit"), field("StreetEdit"),
                      field("TownPostCodeEdit_PostCode"), field("TownPostCodeEdit_Town"), field("PhoneNumberEdit"),
                      field("FaxNumberEdit"), field("ProjectNumberEdit"),
                      brand != nullptr ? brand->currentText() : QString());
    lines << QStringLiteral("Online update: %1 | mode %2 | folder %3 (%4) | daily at %5")
                 .arg(checked("CheckInternet") ? QStringLiteral("on") : QStringLiteral("off"), mode,
                      field("DistributionFolderPath"),
                      folder != nullptr && folder->isReadOnly() ? QStringLiteral("fixed by the mode")
                                                                : QStringLiteral("editable"),
                      time != nullptr ? time->time().toString(QLatin1String(kTimeFormat)) : QString());
    lines << QStringLiteral("App2App: server %1 port %2 | dealer %3")
                 .arg(field("App2AppIP"), field("App2AppPort"), field("App2AppDealerID"));
    lines << QStringLiteral("Users (%1): %2").arg(names.size()).arg(names.join(QStringLiteral(", ")));
    lines << QStringLiteral("Installation: %1 | %2 | version %3 | recording mode %4")
                 .arg(field("Country"), field("Language"), field("SerialNo"),
                      checked("ASRMChk") ? QStringLiteral("on") : QStringLiteral("off"));
    return lines;
}

void ToolConfigurationDialog::showProblems(const QStringList& errors, const QStringList& warnings)
{
    m_problemsList->clear();
    const QIcon errorIcon = style()->standardIcon(QStyle::SP_MessageBoxCritical);
    const QIcon warningIcon = style()->standardIcon(QStyle::SP_MessageBoxWarning);
    for (const QString& error : errors)
        new QListWidgetItem(errorIcon, error, m_problemsList);
    for (const QString& warning : warnings)
        new QListWidgetItem(warningIcon, warning, m_problemsList);
    const bool any = m_problemsList->count() > 0;
    m_problemsTitle->setVisible(any);
    m_problemsList->setVisible(any);
}

QStringList ToolConfigurationDialog::fieldControls() const
{
    QStringList controls;
    for (QWidget* widget : findChildren<QWidget*>())
    {
        const QString name = widget->objectName();
        if (name.isEmpty() || name.startsWith(QLatin1String("qt_")))
            continue;
        QString takes;
        if (const auto* edit = qobject_cast<const QLineEdit*>(widget))
            takes = edit->isReadOnly() ? QString() : QStringLiteral("text");
        else if (qobject_cast<const QRadioButton*>(widget) != nullptr)
            takes = QStringLiteral("1 to choose it");
        else if (qobject_cast<const QCheckBox*>(widget) != nullptr)
            takes = QStringLiteral("1 or 0");
        else if (qobject_cast<const QComboBox*>(widget) != nullptr)
            takes = QStringLiteral("a label of the list");
        else if (qobject_cast<const QTimeEdit*>(widget) != nullptr)
            takes = QStringLiteral("a time HH:mm:ss");
        if (!takes.isEmpty())
            controls << QStringLiteral("%1: %2").arg(name, takes);
    }
    return controls;
}
