#pragma once

#include "LogCapture.h"
#include "SettingsFiles.h"
#include "TempDir.h"
#include "TestText.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

namespace StoreTest
{
const int kWarning = TesselLog_Static::eWARNING;
const int kError = TesselLog_Static::eERROR;

// Settings-file text in the data library's XML layout, for contents the SettingsFiles writers
// do not make (gaps, free slots, unknown or mistyped keys).
inline std::string typed(const std::string& type, const std::string& key, const std::string& value)
{
    return "<" + type + " key=\"" + key + "\">" + value + "</" + type + ">";
}
inline std::string str(const std::string& key, const std::string& value)
{
    return typed("String", key, value);
}

// A temporary folder, a log capture, and a store of type Store on a settings file in it.
template <class Store, class Base = ::testing::Test>
class StoreFixture : public Base
{
protected:
    std::string path() const { return m_dir.file("Data/User/settings.xml"); }
    // A store loaded from a file holding `children`.
    Store& loaded(const std::string& children)
    {
        TempDir::write(path(), "<?xml version=\"1.0\" encoding=\"UTF-8\"?><BSet>" + children + "</BSet>");
        return reread();
    }
    // A fresh store loaded from the file as it is now.
    Store& reread()
    {
        m_store = std::make_unique<Store>(wide(path()));
        EXPECT_TRUE(m_store->load());
        return *m_store;
    }

    TempDir m_dir;
    LogCapture m_log;
    std::unique_ptr<Store> m_store;
};
}
