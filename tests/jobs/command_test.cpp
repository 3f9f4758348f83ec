// The one command helper every manager goes through. Its ordinary path is covered byte for byte by
// the manager's wire tests; this is the path they cannot reach: a request that could not be made.

#include "transport/command.h"

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/heap.h"
#include "api/message_numbers.h"
#include "transport/ZELServerTCPIPChannel.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

TEST(Command, WithoutMemoryNothingIsSentAndTheResponseIsStillReleased)
{
    // Never opened: a command that reached the connection would fail with a send error instead.
    ZELServerTCPIPChannel channel;
    heap::failNextAllocations(1);
    Command command(channel, "KEY");
    EXPECT_FALSE(command.ready());
    command.add("a", "1").addBoolean("b", 1);
    StatusPtr sent(command.send());
    ASSERT_NE(sent, nullptr);
    EXPECT_EQ(sent->getMessageNumber(), msg::kServerError);
    EXPECT_STREQ(sent->getMessage(), "Not enough memory to build the request.");
    StatusPtr transferred(command.transfer("/tmp/never-written", kDownload));
    ASSERT_NE(transferred, nullptr);
    EXPECT_EQ(transferred->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(command.body(), "");
}

}  // namespace
}  // namespace zel
