#pragma once
// The wire fixture of the security and shared resource tests: a channel signed in to the fake server
// as "ann", and the exact payload every later command of that session puts on the wire. The
// handshake is scripted by SetUp, so a test scripts only the steps of its own commands and then
// calls signIn().

#include <memory>
#include <string>

#include <gtest/gtest.h>
#include <zelserverapi/IZELServerStatus.h>

#include "api/ZELServerStatus.h"
#include "api/ZELServerString.h"
#include "session/ZELServerConnectionInfo.h"
#include "support/fake_server.h"
#include "support/helpers.h"
#include "transport/ZELServerTCPIPChannel.h"

namespace zeltest {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

class SignedInChannelTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        server.exchange(request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}}),
                        reply("SUCCESS", R"(<SESSION><IDENTITY id="ann" is_authenticated="true"/></SESSION>)"));
    }

    // Starts the script and signs in; every step of the test must be scripted before.
    void signIn()
    {
        server.start();
        const zel::ZELServerConnectionInfo info(zel::ZELServerString("127.0.0.1"), server.port(),
                                                zel::ZELServerString("ann"), zel::ZELServerString("pw1"));
        const StatusPtr status(channel->open(info, nullptr));
        ASSERT_EQ(status, nullptr) << describe(status.get());
    }

    // A command of the signed-in session: the identity document named after the keyword, the empty
    // client identifier, then the command's own values.
    static Bytes command(const std::string& keyword, const Values& values = {})
    {
        Values all{{"identityObject",
                    xmlDocument(keyword, R"(<IDENTITY id="ann" is_authenticated="true"><ROLES/></IDENTITY>)")},
                   {"clientID", ""}};
        all.insert(all.end(), values.begin(), values.end());
        return request(keyword, all);
    }

    // A payload document as the library writes it: declaration, then a root element named after
    // the command around `content`.
    static std::string xmlDocument(const std::string& root, const std::string& content)
    {
        return R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><)" + root + ">" + content + "</" + root + ">";
    }

    FakeServer server;
    std::unique_ptr<zel::ZELServerTCPIPChannel> channel{new zel::ZELServerTCPIPChannel()};
};

}  // namespace zeltest
