#pragma once
// A signed-in channel on the fake server for the repository wire tests. Each test scripts the
// commands it expects (after the handshake, which the fixture scripts first) and then calls
// connect(). Commands are compared byte for byte, identity document and client identifier included.

#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <zelserverapi/IZELServerStatus.h>

#include "api/ZELServerString.h"
#include "session/ZELServerConnectionInfo.h"
#include "support/environment.h"
#include "support/fake_server.h"
#include "transport/ZELServerTCPIPChannel.h"

namespace zel::repotest {

using StatusPtr = std::unique_ptr<IZELServerStatus>;
using zeltest::Bytes;
using zeltest::Values;

inline const std::string kSessionDocument =
    R"(<SESSION security_enabled="true"><IDENTITY id="ann" is_authenticated="true">)"
    R"(<ROLES><ROLE name="admin"/></ROLES></IDENTITY></SESSION>)";

// The identity document the channel puts in front of every command once signed in; its root element
// is named after the command.
inline std::string identityDocument(const std::string& keyword)
{
    return R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><)" + keyword +
           R"(><IDENTITY id="ann" is_authenticated="true"><ROLES><ROLE name="admin"/></ROLES></IDENTITY></)" +
           keyword + ">";
}

// What a command of this subsystem looks like on the wire: keyword, identity, empty client id, then
// the command's own values.
inline Bytes command(const std::string& keyword, const Values& values = {})
{
    Values all{{"identityObject", identityDocument(keyword)}, {"clientID", ""}};
    all.insert(all.end(), values.begin(), values.end());
    return zeltest::request(keyword, all);
}

// A payload document as the request serialises it: declaration, root named `root`, then `inner`.
inline std::string payloadDocument(const std::string& root, const std::string& inner)
{
    return R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><)" + root + ">" + inner + "</" + root + ">";
}

inline Bytes success(const std::string& body) { return zeltest::reply("SUCCESS", body); }

inline std::string describe(const IZELServerStatus* status)
{
    if (status == nullptr) {
        return "(no status)";
    }
    return std::to_string(status->getMessageNumber()) + ": " + status->getMessage();
}

inline unsigned numberOf(const StatusPtr& status) { return status ? status->getMessageNumber() : 0; }

class RepositoryWireTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        server.expectFrame(zeltest::request("SERVER_SESSION_INIT",
                                            {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}}))
            .sendFrame(success(kSessionDocument));
    }

    void TearDown() override { channel.reset(); }

    // Starts the script and signs in.
    void connect()
    {
        server.start();
        const ZELServerConnectionInfo info(ZELServerString("127.0.0.1"), server.port(), ZELServerString("ann"),
                                           ZELServerString("pw1"));
        const StatusPtr status(channel->open(info, nullptr));
        ASSERT_EQ(status, nullptr) << describe(status.get());
    }

    // Finishes the script and checks that exactly `commands` commands came after the handshake (file
    // headers and acknowledgements are not commands).
    ::testing::AssertionResult sentCommands(std::size_t commands)
    {
        ::testing::AssertionResult verified = server.verify();
        if (!verified) {
            return verified;
        }
        std::size_t sent = 0;
        for (const Bytes& frame : server.frames()) {
            sent += zeltest::parseRequest(frame).has_value() ? 1 : 0;
        }
        if (sent != commands + 1) {
            return ::testing::AssertionFailure() << sent - 1 << " commands sent, expected " << commands;
        }
        return ::testing::AssertionSuccess();
    }

    std::string file(const std::string& name, const std::string& content) const
    {
        const std::filesystem::path path = dir / name;
        std::ofstream(path, std::ios::binary) << content;
        return path.string();
    }

    static std::string slurp(const std::string& path)
    {
        std::ifstream in(path, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), {});
    }

    zeltest::FakeServer server;
    std::unique_ptr<ZELServerTCPIPChannel> channel{new ZELServerTCPIPChannel()};
    const zeltest::TempDir scratch{"zel-repo"};
    const std::filesystem::path& dir = scratch.path();
};

}  // namespace zel::repotest
