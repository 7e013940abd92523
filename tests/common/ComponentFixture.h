#pragma once

#include "BString.h"
#include "CBText.h"
#include "CComponent_Thread_NoRef.h"
#include "CDataManager.h"
#include "ComponentManagerFactory.h"
#include "ID.h"
#include "TestText.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <string>

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

    // Puts a component in the place of `id` that hands out no proxy, so it cannot be reached
    // (a destroyed component alone would be loaded again from its library).
    void makeUnreachable(const ID& id)
    {
        destroyComponent(id);
        ASSERT_EQ(m_manager->registerComponent(std::make_unique<CComponent_Thread_NoRef>(id),
                                               [](IComponent*) -> ProxyComponent* { return nullptr; }),
                  0);
    }

    // A string the library reads from the data manager (a file path, a task setting).
    void setConfig(const wchar_t* uri, const std::string& value)
    {
        ASSERT_EQ(m_dataManager->createData(ID(uri), BString(wide(value))), 0);
    }
    int destroyText() { return destroyComponent(ID(CBText::componentID)); }

    IComponentManager* m_manager = nullptr;
    CDataManager* m_dataManager = nullptr;
    CBText* m_text = nullptr;
};
