#include "Dialog_EditDiagUserInfo.h"

#include "DialogTexts.h"

#include <QGridLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QVBoxLayout>

Dialog_EditDiagUserInfo::Dialog_EditDiagUserInfo(const QStringList& forbiddenNames, QWidget* parent, const char* name,
                                                 Qt::WindowFlags f)
    : QDialog(parent, f),
      m_nameEdit(new QLineEdit(this)),
      m_addressEdit(new QLineEdit(this)),
      m_phoneEdit(new QLineEdit(this)),
      m_okButton(new QPushButton(QStringLiteral("OK"), this)),
      m_cancelButton(new QPushButton(QStringLiteral("Cancel"), this)),
      m_forbiddenNames(forbiddenNames),
      m_nameLabel(new QLabel(this)),
      m_addressLabel(new QLabel(this)),
      m_phoneLabel(new QLabel(this)),
      m_noteLabel(new QLabel(this))
{
    if (name != nullptr)
        setObjectName(QString::fromUtf8(name));
    m_nameEdit->setObjectName(QStringLiteral("nameEdit"));
    m_addressEdit->setObjectName(QStringLiteral("addressEdit"));
    m_phoneEdit->setObjectName(QStringLiteral("phoneEdit"));
    m_okButton->setObjectName(QStringLiteral("okButton"));
    m_cancelButton->setObjectName(QStringLiteral("cancelButton"));
    m_noteLabel->setObjectName(QStringLiteral("noteLabel"));
    m_noteLabel->hide();
    m_okButton->setDefault(true);
    QObject::connect(m_okButton, &QPushButton::clicked, this, &QDialog::accept);
    QObject::connect(m_cancelButton, &QPushButton::clicked, this, &QDialog::reject);

    auto* fields = new QGridLayout();
    fields->addWidget(m_nameLabel, 0, 0);
    fields->addWidget(m_nameEdit, 0, 1);
    fields->addWidget(m_addressLabel, 1, 0);
    fields->addWidget(m_addressEdit, 1, 1);
    fields->addWidget(m_phoneLabel, 2, 0);
    fields->addWidget(m_phoneEdit, 2, 1);
    auto* buttons = new QHBoxLayout();
    buttons->addStretch();
    buttons->addWidget(m_okButton);
    buttons->addWidget(m_cancelButton);
    auto* layout = new QVBoxLayout(this);
    layout->addLayout(fields);
    layout->addWidget(m_noteLabel);
    layout->addLayout(buttons);
}

Dialog_EditDiagUserInfo::~Dialog_EditDiagUserInfo() = default;

bool Dialog_EditDiagUserInfo::init(const QString& title)
{
    setWindowTitle(title);
    m_nameLabel->setText(DialogTexts::text(QStringLiteral("EditDiagUserInfo/Name"), QStringLiteral("Name")));
    m_addressLabel->setText(DialogTexts::text(QStringLiteral("EditDiagUserInfo/Address"), QStringLiteral("Address")));
    m_phoneLabel->setText(DialogTexts::text(QStringLiteral("EditDiagUserInfo/Phone"), QStringLiteral("Telephone")));
    m_okButton->setText(DialogTexts::text(QStringLiteral("EditDiagUserInfo/OK"), QStringLiteral("OK")));
    m_cancelButton->setText(DialogTexts::text(QStringLiteral("EditDiagUserInfo/Cancel"), QStringLiteral("Cancel")));
    return true;
}

void Dialog_EditDiagUserInfo::accept()
{
    const QString name = m_nameEdit->text();
    QString refusal;
    if (name.trimmed().isEmpty())
        refusal =
            DialogTexts::text(QStringLiteral("EditDiagUserInfo/EmptyName"), QStringLiteral("Please enter a name."));
    else if (m_forbiddenNames.contains(name, Qt::CaseSensitive))
        refusal = DialogTexts::text(QStringLiteral("EditDiagUserInfo/NameTaken"),
                                    QStringLiteral("A user with this name already exists."));
    if (!refusal.isEmpty())
    {
        m_noteLabel->setText(refusal);
        m_noteLabel->show();
        m_nameEdit->setFocus();
        return;
    }
    m_noteLabel->clear();
    m_noteLabel->hide();
    QDialog::accept();
}

QString Dialog_EditDiagUserInfo::note() const
{
    return m_noteLabel->text();
}

const QStringList& Dialog_EditDiagUserInfo::forbiddenNames() const
{
    return m_forbiddenNames;
}
