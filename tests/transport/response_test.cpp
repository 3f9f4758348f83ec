// The response: booleans and the identity of the sign-in reply.

#include <memory>
#include <string>

#include <gtest/gtest.h>
#include <zelserverapi/IZELServerIdentity.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "security/ZELServerIdentity.h"
#include "transport/ZELServerResponse.h"

namespace zel {
namespace {

using namespace std::string_literals;

constexpr int kNotXml = static_cast<int>(msg::kXmlFailure);

TEST(Response, BodyIsKeptVerbatimAndOnlyExactlyTrueOrFalseIsABoolean)
{
    ZELServerResponse response(nullptr);
    std::string body = "stale";
    EXPECT_EQ(response.getBody(body), 0);
    EXPECT_EQ(body, "");
    const struct {
        std::string body;
        int result;
        unsigned flag;
    } cases[] = {{"true", 0, 1},       {"false", 0, 0}, {"True", 393604, 7},
                 {"true ", 393604, 7}, {"", 393604, 7}, {"false\0"s, 393604, 7}};
    for (const auto& c : cases) {
        unsigned flag = 7;
        EXPECT_EQ(response.setBody(c.body), 0);
        EXPECT_EQ(response.getBody(body), 0);
        EXPECT_EQ(body, c.body);
        EXPECT_EQ(response.readBoolean(flag), c.result) << c.body;
        EXPECT_EQ(flag, c.flag) << c.body;
    }
}

// What becomes of the channel's identity: "filled" in place, replaced by a single sign-on one ("sso"),
// "made" when there was none, "gone" when the reply has none, "kept" on a failure. (The security
// settings the reply also carries are not checked: the channel drops them.)
TEST(Response, SignInReplyFillsOrReplacesTheIdentity)
{
    const struct {
        std::string body;
        int result;
        std::string fate;
        std::string id;
    } cases[] = {
        {R"(<R><SSO_IDENTITY id="x"/><identity id="ann"/></R>)", 0, "filled", "ann"},
        {R"(<R><SSO_IDENTITY id="bob" state="SUCCEEDED"/></R>)", 0, "sso", "bob"},
        {R"(<R><IDENTITY id="ann"/></R>)", 0, "made", "ann"},
        {R"(<R><G><IDENTITY id="deep"/></G></R>)", 0, "gone", ""},
        {"<R>", kNotXml, "kept", ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.body);
        IZELServerIdentity* const before = c.fate == "made" ? nullptr : new ZELServerIdentity();
        IZELServerIdentity* identity = before;
        ZELServerStringDict settings;
        ZELServerResponse response(nullptr);
        response.setBody(c.body);
        EXPECT_EQ(response.readSessionInit(identity, settings), c.result);
        const std::unique_ptr<IZELServerIdentity> owner(identity);
        EXPECT_TRUE((c.fate != "filled" && c.fate != "kept") || identity == before);
        EXPECT_EQ(dynamic_cast<IZELServerSingleSignOnIdentity*>(identity) != nullptr, c.fate == "sso");
        ASSERT_EQ(identity == nullptr, c.fate == "gone");
        if (identity != nullptr) {
            ZELServerString id;
            identity->getId(id);
            EXPECT_EQ(id.str(), c.id);
        }
    }
}

}  // namespace
}  // namespace zel
