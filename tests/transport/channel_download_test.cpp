// The channel's own file download goes the one download path: the file is received beside the
// destination and replaces it only after a whole file and a successful exchange; every failure
// leaves what the destination held, and no temporary file stays behind.

#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "session/ZELServerConnectionInfo.h"
#include "support/environment.h"
#include "support/fake_server.h"
#include "support/helpers.h"
#include "transport/IZELServerRequest.h"
#include "transport/IZELServerResponse.h"
#include "transport/ZELServerTCPIPChannel.h"

namespace zeltest {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

TEST(ChannelDownloadTest, OnlyACompleteSuccessfulExchangeReplacesTheDestination)
{
    const auto offer = [](FakeServer& s, std::size_t sent) -> FakeServer& {
        return s.sendFrame(fileHeader(5, crc32("fresh"))).expectFrame(readyAck()).sendRaw(std::string("fresh", sent));
    };
    const struct {
        const char* name;
        std::function<void(FakeServer&)> answer;  // the server's part after reading the command
        unsigned number;
        const char* content;  // what the destination holds afterwards
    } cases[] = {
        {"refused in place of the file", [](FakeServer& s) { s.sendFrame(reply("ERROR", "no such file")); }, 393625,
         "old"},
        {"content breaks off", [&](FakeServer& s) { offer(s, 2).closeConnection(); }, 393608, "old"},
        {"refused after the file",
         [&](FakeServer& s) { offer(s, 5).expectFrame(readyAck()).sendFrame(reply("ERROR", "disk full")); }, 393625,
         "old"},
        {"no file", [](FakeServer& s) { s.sendFrame(reply("SUCCESS", "false")); }, 0, "old"},
        {"complete", [&](FakeServer& s) { offer(s, 5).expectFrame(readyAck()).sendFrame(reply("SUCCESS", "true")); }, 0,
         "fresh"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const TempDir folder("zel-channel-download");
        const std::filesystem::path destination = folder.path() / "kept.txt";
        std::ofstream(destination, std::ios::binary) << "old";
        FakeServer server;
        server
            .exchange(request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}}),
                      reply("SUCCESS", R"(<S><IDENTITY id="ann" is_authenticated="true"/></S>)"))
            .expectAnyFrame();
        c.answer(server);
        server.start();
        zel::ZELServerTCPIPChannel channel;
        const zel::ZELServerConnectionInfo info(zel::ZELServerString("127.0.0.1"), server.port(),
                                                zel::ZELServerString("ann"), zel::ZELServerString("pw1"));
        ASSERT_EQ(StatusPtr(channel.open(info, nullptr)), nullptr);
        zel::IZELServerRequest* command = channel.createRequest("XFER");
        zel::IZELServerResponse* response = channel.createResponse();
        const StatusPtr status(
            channel.transferFile(*command, *response, destination.string(), zel::kDownload, nullptr));
        channel.destroyRequest(command);
        channel.destroyResponse(response);
        EXPECT_EQ(status ? status->getMessageNumber() : 0u, c.number) << describe(status.get());
        EXPECT_EQ(slurp(destination), c.content);
        EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.path()), {}), 1) << "no temporary file";
        EXPECT_TRUE(server.verify());
    }
}

}  // namespace
}  // namespace zeltest
