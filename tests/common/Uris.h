#pragma once

// Data-manager addresses the library reads and publishes.
namespace Uri
{
// Where the three settings files are.
const wchar_t* const kWorkshopFile = L"data:/Configuration/MenuBar/WorkshopFile";
const wchar_t* const kUsersFile = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kUpdateFile = L"data:/Configuration/MenuBar/PreparateurConfigFile";
const wchar_t* const kUpdateTmpFile = L"data:/Configuration/MenuBar/PreparateurConfigFileTmp";
const wchar_t* const kBrands = L"data:/Configuration/DoC/Config_Accueil/Brands";

// The scheduled task and the update agent.
const wchar_t* const kEnableOnlineUpdate = L"data:/Configuration/MenuBar/EnableOnlineUpdate";
const wchar_t* const kExecutablePath = L"data:/Configuration/MenuBar/Preparateur/ExecutablePath";
const wchar_t* const kTaskName = L"data:/Configuration/MenuBar/Preparateur/TimeScheduledTask";
const wchar_t* const kAgentExecutable = L"data:/Configuration/OnlineUpdate/UpdateAgentExecutable";

// Published records of the dialog.
const wchar_t* const kActivePreparateur = L"data:/Auto/SystemMenu/ActivePreparateur";
const wchar_t* const kTaskTime = L"data:/Auto/SystemMenu/TaskTimeEdit";
const wchar_t* const kUserSet = L"data:/Auto/SystemMenu/Users/UserSet";
const wchar_t* const kWorkshopPhone = L"data:/Auto/SystemMenu/PhoneNumberEdit";

const wchar_t* const kFactory = L"proc:ProcToolConfiguration?ToolConfigControllersFactory";
}
