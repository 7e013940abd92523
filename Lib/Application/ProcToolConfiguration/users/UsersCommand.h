#pragma once

#include "Export.h"
#include "PDataManager.h"
#include "QListViewItem.h"
#include "SmartProxy.h"
#include "WidgetCommandBase.h"

#include <ace/SString.h>

#include <QString>
#include <QStringList>

class BSet;
class Dialog_EditDiagUserInfo;

// Controller of the users list: publishes the users of the diagnostic-sheet parameters file as
// the user set "data:/Auto/SystemMenu/Users/UserSet" and adds, modifies and deletes users in
// that published set. The file itself is written by the tool configuration's OK.
class TESSEL_EXPORT UsersCommand : public WidgetCommandBase
{
    Q_OBJECT

public:
    explicit UsersCommand(const QString& commandID);
    ~UsersCommand() override;

    bool init() override;

    // Publishes the user set from the users file (an empty set when the file does not load).
    void createDMUsersData();

public slots:
    void onModifyClicked(const QListViewItem* listItem);
    void onAddClicked();
    void onDeleteClicked(const QListViewItem* listItem);

private:
    UsersCommand(const UsersCommand&) = delete;
    UsersCommand& operator=(const UsersCommand&) = delete;

    void populateForbiddenList(const BSet& users, QStringList& names);
    void decorateDialog(Dialog_EditDiagUserInfo& dialog);
    void findKeyForUser(const QString& name, ACE_WString& key);

    // The user entry { "name", "phone", "address" } from the accepted edit dialog; an empty
    // telephone takes the workshop's number.
    BSet readUserEntry(const Dialog_EditDiagUserInfo& dialog);

    SmartProxy<PDataManager> m_dataManager;
};
