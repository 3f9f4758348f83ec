// The mount point manager against the fake server: listing and looking up shared resources, and
// mount points that can talk to the server through the manager's channel.

#include "sharedresources/ZELServerMountPointManager.h"

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "sharedresources/sharedresources_factories.h"
#include "support/signed_in_channel.h"

namespace zel {
namespace {

using zeltest::describe;
using zeltest::StatusPtr;
using MountPoints = std::unique_ptr<IZELServerVector<IZELServerMountPoint>>;

unsigned numberOf(const IZELServerStatus* status) { return status ? status->getMessageNumber() : 0; }

// Name and description of a mount point, as "name|description".
std::string textsOf(const IZELServerMountPoint& mountPoint)
{
    ZELServerString name;
    ZELServerString description;
    mountPoint.getName(name);
    mountPoint.getDescription(description);
    return name.str() + "|" + description.str();
}

const std::string kTwoResources =
    R"(<SR_GET_SHAREDRESOURCES><SHAREDRESOURCE name="DATA" displayname="Input data" description="Files the jobs read"/>)"
    R"(<SHAREDRESOURCE name="OUT" displayname="Output" description=""/></SR_GET_SHAREDRESOURCES>)";

class MountPointManagerTest : public zeltest::SignedInChannelTest {
protected:
    std::unique_ptr<IZELServerMountPointManager> manager{makeMountPointManager(channel.get())};
};

TEST_F(MountPointManagerTest, GetSharedResourcesListsThemAndTheyTalkThroughTheSameConnection)
{
    server.exchange(command("SR_GET_SHAREDRESOURCES"), zeltest::reply("SUCCESS", kTwoResources))
        .exchange(
            command("SR_MAKE", {{"srName", "OUT"},
                                {"srPath", xmlDocument("SR_MAKE", R"(<PATH abspath="/new" dirpath="" name="new"/>)")}}),
            zeltest::reply("SUCCESS", "true"));
    signIn();
    const MountPoints mountPoints(makeMountPointVector());
    mountPoints->append(makeMountPoint(nullptr));
    const StatusPtr status(manager->getSharedResources(*mountPoints));
    ASSERT_EQ(status, nullptr) << describe(status.get());
    ASSERT_EQ(mountPoints->entries(), 2u);
    EXPECT_EQ(textsOf(*mountPoints->element(0)), "DATA|Files the jobs read");
    EXPECT_EQ(textsOf(*mountPoints->element(1)), "OUT|");

    IZELServerMountPoint& out = *mountPoints->element(1);
    IZELServerPath* path = out.createPath(ZELServerString("new"));
    const StatusPtr made(out.makeDirectory(*path));
    EXPECT_EQ(made, nullptr) << describe(made.get());
    out.releaseObject(path);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointManagerTest, GetSharedResourcesFailuresLeaveTheListAlone)
{
    server.exchange(command("SR_GET_SHAREDRESOURCES"), zeltest::reply("ERROR", "Authorization Error: no"))
        .exchange(command("SR_GET_SHAREDRESOURCES"), zeltest::reply("SUCCESS", "true"))
        .exchange(command("SR_GET_SHAREDRESOURCES"), zeltest::reply("SUCCESS", "<SR_GET_SHAREDRESOURCES/>"));
    signIn();
    const MountPoints mountPoints(makeMountPointVector());
    mountPoints->append(makeMountPoint(nullptr));
    const StatusPtr denied(manager->getSharedResources(*mountPoints));
    ASSERT_EQ(numberOf(denied.get()), msg::kServerError);
    EXPECT_EQ(denied->getCode(), 2u);
    EXPECT_EQ(numberOf(StatusPtr(manager->getSharedResources(*mountPoints)).get()), msg::kXmlFailure);
    EXPECT_EQ(mountPoints->entries(), 1u);
    EXPECT_EQ(numberOf(StatusPtr(manager->getSharedResources(*mountPoints)).get()), 0u);
    EXPECT_EQ(mountPoints->entries(), 0u) << "a server without resources lists none";
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointManagerTest, GetSharedResourceFillsAndBindsTheMountPointOrLeavesFoundAtZero)
{
    const auto lookUp = [](const char* name) { return command("SR_GET_SHAREDRESOURCE", {{"srName", name}}); };
    server.exchange(lookUp("NOPE"), zeltest::reply("SUCCESS", "<SR_GET_SHAREDRESOURCE/>"))
        .exchange(lookUp("DATA"), zeltest::reply("ERROR", "down"))
        .exchange(lookUp("DATA"), zeltest::reply("SUCCESS", "<unclosed"))
        .exchange(lookUp("DATA"),
                  zeltest::reply("SUCCESS", R"(<SR_GET_SHAREDRESOURCE><SHAREDRESOURCE name="DATA" )"
                                            R"(displayname="Input data" description="d"/></SR_GET_SHAREDRESOURCE>)"))
        .exchange(
            command("SR_EXISTS", {{"srName", "DATA"},
                                  {"srPath", xmlDocument("SR_EXISTS", R"(<PATH abspath="/a" dirpath="" name="a"/>)")}}),
            zeltest::reply("SUCCESS", "true"));
    signIn();
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    const std::pair<const char*, unsigned> failures[] = {
        {"NOPE", 0}, {"DATA", msg::kServerError}, {"DATA", msg::kXmlFailure}};
    for (const auto& [name, number] : failures) {
        unsigned found = 7;
        EXPECT_EQ(numberOf(StatusPtr(manager->getSharedResource(ZELServerString(name), *mountPoint, found)).get()),
                  number);
        EXPECT_EQ(found, 0u) << number;
        EXPECT_EQ(textsOf(*mountPoint), "|");
    }
    unsigned found = 0;
    const StatusPtr status(manager->getSharedResource(ZELServerString("DATA"), *mountPoint, found));
    ASSERT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(textsOf(*mountPoint), "DATA|d");
    // The mount point was made without a channel and now talks through the manager's.
    IZELServerPath* path = mountPoint->createPath(ZELServerString("a"));
    unsigned present = 0;
    EXPECT_EQ(numberOf(StatusPtr(mountPoint->exists(*path, present)).get()), 0u);
    EXPECT_EQ(present, 1u);
    mountPoint->releaseObject(path);
    EXPECT_TRUE(server.verify());
}

TEST(MountPointManagerWithoutChannel, AnswersNotConnected)
{
    const std::unique_ptr<IZELServerMountPointManager> manager(makeMountPointManager(nullptr));
    const MountPoints mountPoints(makeMountPointVector());
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    unsigned found = 7;
    EXPECT_EQ(numberOf(StatusPtr(manager->getSharedResources(*mountPoints)).get()), msg::kNotConnected);
    EXPECT_EQ(numberOf(StatusPtr(manager->getSharedResource(ZELServerString("DATA"), *mountPoint, found)).get()),
              msg::kNotConnected);
    EXPECT_EQ(found, 0u);
}

}  // namespace
}  // namespace zel
