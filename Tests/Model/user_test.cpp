// Accounts.
#include "Model/User.h"
#include "ModelTest.h"

namespace ZOCL {
namespace {

class UserTest : public ModelTest {};

TEST_F(UserTest, AccessorsReadTheBlock) {
    const auto user = Make<User>(
        "{'zo:userId':'u','properties':{'firstname':'Ad\\u00e8le','email':'a@b'},'logins':[{'ip':'1.2.3.4',"
        "'hostname':'h','useragent':'z'},{}]}");
    EXPECT_EQ(user->GetUserID().view(), "u");
    EXPECT_EQ(user->GetFirstName(), u"Ad\u00e8le");
    EXPECT_TRUE(user->GetLastName().empty());
    EXPECT_EQ(user->GetEmail().view(), "a@b");
    const auto logins = user->GetCurrentLogins();
    ASSERT_EQ(logins.size(), 2u);
    EXPECT_EQ(logins[0].hostName.view(), "h");
    EXPECT_EQ(logins[0].userAgent.view(), "z");
    EXPECT_TRUE(logins[1].ip.IsNull());
    EXPECT_TRUE(Make<User>("{}")->GetCurrentLogins().empty());
}

}  // namespace
}  // namespace ZOCL
