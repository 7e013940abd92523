// One QApplication for the whole test program (widgets and the file watcher need it).

#include <QApplication>

#include <gtest/gtest.h>

#include <memory>

namespace
{
class ApplicationEnvironment : public ::testing::Environment
{
public:
    void SetUp() override { m_application = std::make_unique<QApplication>(m_argc, m_argv); }
    void TearDown() override { m_application.reset(); }

private:
    int m_argc = 1;
    char m_name[16] = "ComponentsTests";
    char* m_argv[2] = {m_name, nullptr};
    std::unique_ptr<QApplication> m_application;
};

::testing::Environment* const s_environment = ::testing::AddGlobalTestEnvironment(new ApplicationEnvironment);
}
