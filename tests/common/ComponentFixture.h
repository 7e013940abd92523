#pragma once

#include "CBText.h"
#include "CDataManager.h"
#include "ComponentManagerFactory.h"
#include "ID.h"

#include <gtest/gtest.h>

#include <cstdlib>

// Gives each test a fresh data manager and text component, registered with the process's
// component manager, and destroys every component afterwards. The raw pointers are observers
// (the manager owns the components); they become null when the test destroys a component
// through the helpers below.
class ComponentFixture : public ::testing::Test
{
protected:
    void SetUp() override
    {
        m_manager = ComponentManagerFactory::getComponentManager();
        ASSERT_NE(m_manager, nullptr);
        if (const char* bin = std::getenv("PTC_BIN_DIR"))
            m_manager->setLibraryPath(bin);
        // A component left behind by an earlier test would make the registration fail.
        m_manager->destroyComponent(ID(CDataManager::componentID));
        m_manager->destroyComponent(ID(CBText::componentID));
        m_dataManager = CDataManager::registerWith(*m_manager);
        m_text = CBText::registerWith(*m_manager);
        ASSERT_NE(m_dataManager, nullptr);
        ASSERT_NE(m_text, nullptr);
    }

    void TearDown() override
    {
        if (m_manager == nullptr)
            return;
        m_manager->destroyAllComponents();
        m_manager->release();
        m_manager = nullptr;
        m_dataManager = nullptr;
        m_text = nullptr;
    }

    // Destroys one component; its proxies receive EventDestroyingComponent and stay alive.
    int destroyComponent(const ID& id)
    {
        if (id == ID(CDataManager::componentID))
            m_dataManager = nullptr;
        if (id == ID(CBText::componentID))
            m_text = nullptr;
        return m_manager->destroyComponent(id);
    }
    int destroyDataManager() { return destroyComponent(ID(CDataManager::componentID)); }
    int destroyText() { return destroyComponent(ID(CBText::componentID)); }

    IComponentManager* m_manager = nullptr;
    CDataManager* m_dataManager = nullptr;
    CBText* m_text = nullptr;
};
