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

std::string nameOf(const IZELServerMountPoint& mountPoint)
{
    ZELServerString text;
    mountPoint.getName(text);
    return text.str();
}

std::string descriptionOf(const IZELServerMountPoint& mountPoint)
{
    ZELServerString text;
    mountPoint.getDescription(text);
    return text.str();
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
        .exchange(command("SR_MAKE", {{"srName", "OUT"},
                                      {"srPath", xmlDocument("SR_MAKE", R"(<PATH abspath="/new" dirpath="" name="new"/>)")}}),
                  zeltest::reply("SUCCESS", "true"));
    signIn();
    const MountPoints mountPoints(makeMountPointVector());
    mountPoints->append(makeMountPoint(nullptr));
    const StatusPtr status(manager->getSharedResources(*mountPoints));
    ASSERT_EQ(status, nullptr) << describe(status.get());
    ASSERT_EQ(mountPoints->entries(), 2u);
    EXPECT_EQ(nameOf(*mountPoints->element(0)), "DATA");
    EXPECT_EQ(descriptionOf(*mountPoints->element(0)), "Files the jobs read");
    EXPECT_EQ(nameOf(*mountPoints->element(1)), "OUT");

    IZELServerMountPoint& out = *mountPoints->element(1);
    IZELServerPath* path = out.createPath(ZELServerString("new"));
    const StatusPtr made(out.makeDirectory(*path));
    EXPECT_EQ(made, nullptr) << describe(made.get());
    out.releaseObject(path);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointManagerTest, GetSharedResourcesFailures)
{
    server.exchange(command("SR_GET_SHAREDRESOURCES"), zeltest::reply("ERROR", "Authorization Error: no"))
        .exchange(command("SR_GET_SHAREDRESOURCES"), zeltest::reply("SUCCESS", "true"))
        .exchange(command("SR_GET_SHAREDRESOURCES"), zeltest::reply("SUCCESS", "<SR_GET_SHAREDRESOURCES/>"));
    signIn();
    const MountPoints mountPoints(makeMountPointVector());
    mountPoints->append(makeMountPoint(nullptr));
    StatusPtr status(manager->getSharedResources(*mountPoints));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(status->getCode(), 2u);
    status.reset(manager->getSharedResources(*mountPoints));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kXmlFailure);
    EXPECT_EQ(mountPoints->entries(), 1u) << "failures leave the caller's list alone";
    status.reset(manager->getSharedResources(*mountPoints));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(mountPoints->entries(), 0u) << "a server without resources lists none";
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointManagerTest, GetSharedResourceFillsTheMountPointAndBindsIt)
{
    server.exchange(command("SR_GET_SHAREDRESOURCE", {{"srName", "DATA"}}),
                    zeltest::reply("SUCCESS", R"(<SR_GET_SHAREDRESOURCE><SHAREDRESOURCE name="DATA" displayname="Input data" )"
                                              R"(description="d"/></SR_GET_SHAREDRESOURCE>)"))
        .exchange(command("SR_EXISTS", {{"srName", "DATA"},
                                        {"srPath", xmlDocument("SR_EXISTS", R"(<PATH abspath="/a" dirpath="" name="a"/>)")}}),
                  zeltest::reply("SUCCESS", "true"));
    signIn();
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    unsigned found = 0;
    const StatusPtr status(manager->getSharedResource(ZELServerString("DATA"), *mountPoint, found));
    ASSERT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(nameOf(*mountPoint), "DATA");

    IZELServerPath* path = mountPoint->createPath(ZELServerString("a"));
    unsigned present = 0;
    const StatusPtr exists(mountPoint->exists(*path, present));
    EXPECT_EQ(exists, nullptr) << describe(exists.get()) << " (the mount point was made without a channel)";
    EXPECT_EQ(present, 1u);
    mountPoint->releaseObject(path);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointManagerTest, AnUnknownResourceIsNotFoundAndNoFailure)
{
    server.exchange(command("SR_GET_SHAREDRESOURCE", {{"srName", "NOPE"}}),
                    zeltest::reply("SUCCESS", "<SR_GET_SHAREDRESOURCE/>"));
    signIn();
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    unsigned found = 7;
    const StatusPtr status(manager->getSharedResource(ZELServerString("NOPE"), *mountPoint, found));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(found, 0u);
    EXPECT_EQ(nameOf(*mountPoint), "");
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointManagerTest, GetSharedResourceFailuresLeaveFoundAtZero)
{
    server.exchange(command("SR_GET_SHAREDRESOURCE", {{"srName", "DATA"}}), zeltest::reply("ERROR", "down"))
        .exchange(command("SR_GET_SHAREDRESOURCE", {{"srName", "DATA"}}), zeltest::reply("SUCCESS", "<unclosed"));
    signIn();
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    unsigned found = 7;
    StatusPtr status(manager->getSharedResource(ZELServerString("DATA"), *mountPoint, found));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(found, 0u);
    found = 7;
    status.reset(manager->getSharedResource(ZELServerString("DATA"), *mountPoint, found));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kXmlFailure);
    EXPECT_EQ(found, 0u);
    EXPECT_TRUE(server.verify());
}

TEST(MountPointManagerWithoutChannel, AnswersNotConnected)
{
    const std::unique_ptr<IZELServerMountPointManager> manager(makeMountPointManager(nullptr));
    const MountPoints mountPoints(makeMountPointVector());
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    unsigned found = 7;
    const StatusPtr list(manager->getSharedResources(*mountPoints));
    const StatusPtr one(manager->getSharedResource(ZELServerString("DATA"), *mountPoint, found));
    ASSERT_NE(list, nullptr);
    ASSERT_NE(one, nullptr);
    EXPECT_EQ(list->getMessageNumber(), msg::kNotConnected);
    EXPECT_EQ(one->getMessageNumber(), msg::kNotConnected);
    EXPECT_EQ(found, 0u);
}

}  // namespace
}  // namespace zel
