// A listing with depth against a server that reports a directory inside itself: the walk ends at the
// bound on all entries together, keeping what it met, in the order of a walk that lists each
// directory right behind itself.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerMountPoint.h"
#include "support/signed_in_channel.h"

namespace zel {
namespace {

using Entries = ZELServerVector<IZELServerFileInfo, ZELServerFileInfo>;

// Two entries, "loop" a directory whose listing is this listing again, and "f" a file.
zeltest::Bytes loopListing()
{
    const auto entry = [](const char* type, const char* name) {
        return std::string(R"(<FILEINFO filetype=")") + type + R"(" size="0" date=""><PATH name=")" + name +
               R"(" dirpath="d" abspath="d/)" + name + R"("/></FILEINFO>)";
    };
    return zeltest::reply("SUCCESS", "<SR_LIST>" + entry("DIR", "loop") + entry("FILE", "f") + "</SR_LIST>");
}

class DeepListingTest : public zeltest::SignedInChannelTest {};

TEST_F(DeepListingTest, EndsAtTheBoundOnAllEntriesKeepingWhatItMet)
{
    for (int i = 0; i < 3; ++i) {
        server.expectAnyFrame().sendFrame(loopListing());
    }
    signIn();
    ZELServerMountPoint area(channel.get());
    IZELServerPath* path = area.createPath(ZELServerString("d"));
    Entries entries;
    const zeltest::StatusPtr status(area.listWithin(*path, 1000, entries, 5));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), 393604u);
    EXPECT_NE(std::string(status->getMessage()).find("more than 5 entries"), std::string::npos);
    std::vector<std::string> names;
    for (unsigned i = 0; i < entries.entries(); ++i) {
        ZELServerString name;
        entries.element(i)->getPath().getName(name);
        names.push_back(name.str());
    }
    EXPECT_EQ(names, (std::vector<std::string>{"loop", "loop", "f", "f"}));
    area.releaseObject(path);
    EXPECT_TRUE(server.verify());
}

}  // namespace
}  // namespace zel
