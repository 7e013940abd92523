#include "CComponent_Thread_NoRef.h"
#include "WideString.h"

#include <gtest/gtest.h>

namespace
{
TEST(ComponentBaseTest, StateNamesTheComponentAndCountsNeverGoBelowZero)
{
    CComponent_Thread_NoRef component(ID("test:Unit?A&B<\"C\">"));
    EXPECT_EQ(component.detachProxy(), -1);
    EXPECT_EQ(component.release(), -1);
    EXPECT_EQ(component.attachProxy(), 1);
    EXPECT_EQ(component.attachProxy(), 2);
    EXPECT_EQ(component.detachProxy(), 1);
    EXPECT_EQ(component.acquire(), 1);
    EXPECT_EQ(component.attach(), 1);
    EXPECT_EQ(component.getAttachedProxyCount(), 1);

    const std::string state = WideString::toUtf8(component.getXMLState());
    // Markup in the identifier is escaped ('>' needs none inside an attribute).
    EXPECT_EQ(state, "<component id=\"test:Unit?A&amp;B&lt;&quot;C&quot;>\" attached=\"1\" proxies=\"1\" "
                     "references=\"1\"/>");
}
}
