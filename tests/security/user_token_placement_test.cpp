// Where a user token may stand in a reply: only as a child of the document element.

#include <string>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "security/ZELServerUserToken.h"

namespace zel {
namespace {

TEST(UserTokenPlacement, OnlyAChildOfTheDocumentElementIsTheToken)
{
    struct Case {
        const char* body;
        int result;
    };
    const Case cases[] = {
        {R"(<R><USERTOKEN token="t"/></R>)", 0},
        {R"(<USERTOKEN token="t"/>)", static_cast<int>(msg::kUnreadableReply)},
        {R"(<R><X><USERTOKEN token="t"/></X></R>)", static_cast<int>(msg::kUnreadableReply)},
    };
    for (const Case& c : cases) {
        ZELServerUserToken token;
        EXPECT_EQ(readUserTokenReply(c.body, token), c.result) << c.body;
        ZELServerString value;
        token.getToken(value);
        EXPECT_EQ(value.str(), c.result == 0 ? "t" : "") << c.body;
    }
}

}  // namespace
}  // namespace zel
