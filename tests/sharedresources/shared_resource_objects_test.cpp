// Paths, file descriptions and shared resources as objects: how paths are made, and how the
// "FILEINFO" and "SHAREDRESOURCE" readers fill them from reply bodies. No connection needed.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerMountPoint.h"
#include "sharedresources/ZELServerPath.h"
#include "sharedresources/shared_resource_readers.h"
#include "sharedresources/sharedresources_factories.h"
#include "transport/IZELServerChannel.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

// Name, directory and absolute path, as "name|dirpath|abspath".
std::string textsOf(const IZELServerPath& path)
{
    ZELServerString name("stale");
    ZELServerString directory("stale");
    ZELServerString absolute("stale");
    path.getName(name);
    path.getDirectoryPath(directory);
    path.getAbsolutePath(absolute);
    return name.str() + "|" + directory.str() + "|" + absolute.str();
}

// Name, display name and description, as "name|displayname|description".
std::string textsOf(const IZELServerMountPoint& mountPoint)
{
    ZELServerString name("stale");
    ZELServerString displayName("stale");
    ZELServerString description("stale");
    mountPoint.getName(name);
    mountPoint.getDisplayName(displayName);
    mountPoint.getDescription(description);
    return name.str() + "|" + displayName.str() + "|" + description.str();
}

// A channel the readers can bind objects to; nothing is ever sent through it.
IZELServerChannel* fakeChannel(int n)
{
    return reinterpret_cast<IZELServerChannel*>(static_cast<std::uintptr_t>(0x1000 * n));
}

// ---- Paths ------------------------------------------------------------------------------------------

TEST(Path, FromAWholePathSplitsAtTheLastSlashAndFromPartsJoinsThemWithOneSlash)
{
    const std::pair<const char*, const char*> wholes[] = {
        {"in/2024/data.csv", "data.csv|in/2024|in/2024/data.csv"},
        {"data.csv", "data.csv||/data.csv"},
        {"/in/data.csv", "data.csv|/in|/in/data.csv"},
        {"a//b", "b|a/|a/b"},
        {"in\\data.csv", "in\\data.csv||/in\\data.csv"},
    };
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    for (const auto& [whole, expected] : wholes) {
        IZELServerPath* path = mountPoint->createPath(ZELServerString(whole));
        ASSERT_NE(path, nullptr);
        EXPECT_EQ(textsOf(*path), expected) << '"' << whole << '"';
        mountPoint->releaseObject(path);
    }
    // Both parts are kept as given; only the absolute path joins them.
    const std::pair<std::pair<const char*, const char*>, const char*> parts[] = {
        {{"in/2024", "data.csv"}, "in/2024/data.csv"},
        {{"in//", "//data.csv"}, "in/data.csv"},
        {{"", "data.csv"}, "/data.csv"},
        {{"in", ""}, "in/"},
    };
    for (const auto& [given, absolute] : parts) {
        IZELServerPath* path = mountPoint->createPath(ZELServerString(given.first), ZELServerString(given.second));
        ASSERT_NE(path, nullptr);
        EXPECT_EQ(textsOf(*path), std::string(given.second) + "|" + given.first + "|" + absolute);
        mountPoint->releaseObject(path);
    }
}

// ---- File descriptions ------------------------------------------------------------------------------

std::string fileInfoReply(const std::string& elements) { return "<SR_LIST>" + elements + "</SR_LIST>"; }

TEST(FileInfoReader, ReadsTypeSizeDateAndThePathFromItsChildOrItself)
{
    ZELServerFileInfo info;
    ASSERT_EQ(readFileInfoReply(fileInfoReply(R"(<FILEINFO filetype="DIR" size="0" date="2024-05-01T12:00:00Z" )"
                                              R"(name="wrong" dirpath="wrong" abspath="wrong">)"
                                              R"(<PATH name="out" dirpath="jobs/7" abspath="jobs/7/out"/></FILEINFO>)"),
                                info),
              0);
    EXPECT_TRUE(info.isDirectory());
    EXPECT_EQ(info.getSize(), 0u);
    ZELServerString date;
    info.getDate(date);
    EXPECT_EQ(date.str(), "2024-05-01T12:00:00Z");
    EXPECT_EQ(textsOf(info.getPath()), "out|jobs/7|jobs/7/out");
    ASSERT_EQ(readFileInfoReply(fileInfoReply(R"(<FILEINFO filetype="FILE" size="12" name="a.txt" dirpath="in" )"
                                              R"(abspath="in/a.txt"/>)"),
                                info),
              0);
    EXPECT_FALSE(info.isDirectory());
    EXPECT_EQ(info.getSize(), 12u);
    EXPECT_EQ(textsOf(info.getPath()), "a.txt|in|in/a.txt");
}

TEST(FileInfoReader, OnlyTheExactTextDirIsADirectoryAndSizeIsAnUnsignedNumberOrZero)
{
    for (const char* type : {"DIR", "dir", "DIR ", "FILE"}) {
        ZELServerFileInfo info;
        ASSERT_EQ(readFileInfoReply(fileInfoReply(std::string(R"(<FILEINFO filetype=")") + type + R"("/>)"), info), 0);
        EXPECT_EQ(info.isDirectory(), std::string(type) == "DIR") << "filetype \"" << type << "\"";
    }
    const std::pair<const char*, unsigned> sizes[] = {
        // null text: attribute absent
        {"0x10", 16}, {"4294967295", 4294967295u}, {"4294967296", 0}, {"-1", 0}, {"12abc", 0}, {nullptr, 0},
    };
    for (const auto& [text, expected] : sizes) {
        ZELServerFileInfo info;
        const std::string attribute = text ? std::string(R"( size=")") + text + "\"" : "";
        ASSERT_EQ(readFileInfoReply(fileInfoReply("<FILEINFO filetype=\"FILE\"" + attribute + "/>"), info), 0);
        EXPECT_EQ(info.getSize(), expected) << "size \"" << (text ? text : "(absent)") << "\"";
    }
}

TEST(FileInfoReader, FailuresLeaveTheDescriptionOrTheListAlone)
{
    ZELServerFileInfo info;
    ASSERT_EQ(readFileInfoReply(fileInfoReply(R"(<FILEINFO filetype="DIR" size="9"/>)"), info), 0);
    EXPECT_EQ(readFileInfoReply("<SR_GET/>", info), static_cast<int>(msg::kUnreadableReply));
    EXPECT_EQ(readFileInfoReply("<SR_GET><fileinfo filetype=\"FILE\"/></SR_GET>", info),
              static_cast<int>(msg::kUnreadableReply));
    EXPECT_EQ(readFileInfoReply("true", info), static_cast<int>(msg::kXmlFailure));
    EXPECT_TRUE(info.isDirectory());
    EXPECT_EQ(info.getSize(), 9u);

    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> infos;
    infos.append(new ZELServerFileInfo());
    EXPECT_EQ(readFileInfosReply("not xml", infos), static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(infos.entries(), 1u);
}

TEST(FileInfoReader, AListHoldsOneDescriptionPerElementInOrderAndReplacesTheOldContent)
{
    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> infos;
    infos.append(new ZELServerFileInfo());
    ASSERT_EQ(readFileInfosReply(fileInfoReply(R"(<FILEINFO filetype="DIR" name="a"/>)"
                                               R"(<FILEINFO filetype="FILE" size="3" name="b"/>)"
                                               R"(<FILEINFO filetype="FILE" size="0x4" name="c"/>)"),
                                 infos),
              0);
    ASSERT_EQ(infos.entries(), 3u);
    std::vector<std::string> read;
    for (unsigned i = 0; i < 3; ++i) {
        ZELServerString name;
        infos.at(i)->getPath().getName(name);
        read.push_back(name.str() + (infos.at(i)->isDirectory() ? " dir " : " file ") +
                       std::to_string(infos.at(i)->getSize()));
    }
    EXPECT_EQ(read, (std::vector<std::string>{"a dir 0", "b file 3", "c file 4"}));
    ASSERT_EQ(readFileInfosReply("<SR_LIST/>", infos), 0) << "an empty directory is a listing too";
    EXPECT_EQ(infos.entries(), 0u);
}

// ---- Shared resources -------------------------------------------------------------------------------

TEST(SharedResourceReader, FillsTheMountPointAndBindsItOrLeavesItAloneOnFailure)
{
    ZELServerMountPoint mountPoint(fakeChannel(1));
    ASSERT_EQ(
        readMountPointReply(R"(<SR_GET_SHAREDRESOURCE><SHAREDRESOURCE name="DATA" displayname="Input &amp; output" )"
                            R"(description="Files the jobs read"/></SR_GET_SHAREDRESOURCE>)",
                            fakeChannel(2), mountPoint),
        0);
    EXPECT_EQ(textsOf(mountPoint), "DATA|Input & output|Files the jobs read");
    EXPECT_EQ(mountPoint.channel(), fakeChannel(2));
    EXPECT_EQ(readMountPointReply("<SR_GET_SHAREDRESOURCE/>", fakeChannel(3), mountPoint),
              static_cast<int>(msg::kUnreadableReply));
    EXPECT_EQ(readMountPointReply("", fakeChannel(3), mountPoint), static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(textsOf(mountPoint), "DATA|Input & output|Files the jobs read");
    EXPECT_EQ(mountPoint.channel(), fakeChannel(2));
}

TEST(SharedResourceReader, AListMakesOneBoundMountPointPerElement)
{
    const std::unique_ptr<IZELServerVector<IZELServerMountPoint>> mountPoints(makeMountPointVector());
    mountPoints->append(makeMountPoint(nullptr));
    ASSERT_EQ(readMountPointsReply(
                  R"(<SR_GET_SHAREDRESOURCES><SHAREDRESOURCE name="A" displayname="a" description=""/>)"
                  R"(<SHAREDRESOURCE name="B" displayname="b" description="second"/></SR_GET_SHAREDRESOURCES>)",
                  fakeChannel(4), *mountPoints),
              0);
    ASSERT_EQ(mountPoints->entries(), 2u);
    EXPECT_EQ(textsOf(*mountPoints->element(0)), "A|a|");
    EXPECT_EQ(textsOf(*mountPoints->element(1)), "B|b|second");
    for (unsigned i = 0; i < 2; ++i) {
        const auto* concrete = dynamic_cast<const ZELServerMountPoint*>(mountPoints->element(i));
        ASSERT_NE(concrete, nullptr);
        EXPECT_EQ(concrete->channel(), fakeChannel(4));
    }
}

}  // namespace
}  // namespace zel
