#pragma once

#include "CMediator.h"
#include "CMessageBoxManager.h"
#include "CProcStartUpdateAgent.h"
#include "CQ17FileSystemWatcher.h"
#include "ComponentFixture.h"
#include "SettingsFiles.h"
#include "TaskSchedulerSettings.h"
#include "TempDir.h"
#include "TesselLog_Static.h"
#include "Uris.h"

#include <ace/Thread_Manager.h>

#include <string>

// The whole framework a dialog needs (data manager, texts, watcher, message boxes, mediator and
// update-agent starter), a tasks folder of the test's own, and the three settings files in a
// fresh folder: a workshop, Anna, Bruno and Clara with an App2App block, online updates off in
// LOCAL mode at 07:30:00. The log level is restored afterwards.
class DialogFixture : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_level = TesselLog_Static::getLevel_static();
        ASSERT_NE(CQ17FileSystemWatcher::registerWith(*m_manager), nullptr);
        m_boxes = CMessageBoxManager::registerWith(*m_manager);
        ASSERT_NE(m_boxes, nullptr);
        m_mediator = CMediator::registerWith(*m_manager);
        ASSERT_NE(m_mediator, nullptr);
        m_agent = CProcStartUpdateAgent::registerWith(*m_manager);
        ASSERT_NE(m_agent, nullptr);
        m_agent->setTestAnswer(0, 0);
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setServiceState(0);

        m_workshopPath = m_dir.file("Data/User/InformationsGarage.xml");
        m_usersPath = m_dir.file("Data/User/FicheDiagParams.xml");
        m_updatePath = m_dir.file("Data/User/OnLineUpdate/Preparateur.xml");
        m_updateTmpPath = m_dir.file("Data/User/OnLineUpdate/PreparateurTmp.xml");
        setConfig(Uri::kWorkshopFile, m_workshopPath);
        setConfig(Uri::kUsersFile, m_usersPath);
        setConfig(Uri::kUpdateFile, m_updatePath);
        setConfig(Uri::kUpdateTmpFile, m_updateTmpPath);
        m_text->setText(L"1"_w, L"Marque A"_w);
        m_text->setText(L"2"_w, L"Marque B"_w);
        BSet brands(10);
        brands.setString(L"1"_w, L"Marque A"_w);
        brands.setString(L"2"_w, L"Marque B"_w);
        ASSERT_EQ(m_dataManager->createData(ID(Uri::kBrands), brands), 0);

        SettingsFiles::writeWorkshop(m_workshopPath, {{"numero_affaire", "BN-42"},
                                                      {"raison_sociale", "Garage du Pont"},
                                                      {"nom", "Garage Ünal"},
                                                      {"rue", "1 rue Haute"},
                                                      {"ville", "Lyon"},
                                                      {"codepostal", "69001"},
                                                      {"telephone", "0102030405"},
                                                      {"telecopie", "0607080910"}});
        SettingsFiles::writeUsers(m_usersPath, {kAnna, kBruno, kClara});
        SettingsFiles::writeUpdate(m_updatePath);
    }

    void TearDown() override
    {
        ACE_Thread_Manager::instance()->wait();
        ComponentFixture::TearDown();
        TaskSchedulerSettings::setTasksFolder(std::string());
        TesselLog_Static::setLevel_static(m_level);
    }

    TempDir m_dir;
    std::string m_workshopPath;
    std::string m_usersPath;
    std::string m_updatePath;
    std::string m_updateTmpPath;
    CMessageBoxManager* m_boxes = nullptr;
    CMediator* m_mediator = nullptr;
    CProcStartUpdateAgent* m_agent = nullptr;

private:
    int m_level = 0;
};
