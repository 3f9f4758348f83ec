// Paths, file descriptions and shared resources as objects: how paths are made, and how the
// "FILEINFO" and "SHAREDRESOURCE" readers fill them from reply bodies. No connection needed.

#include <cstdint>
#include <memory>
#include <ostream>
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

struct PathTexts {
    std::string name;
    std::string directory;
    std::string absolute;
    bool operator==(const PathTexts&) const = default;
};

void PrintTo(const PathTexts& texts, std::ostream* out)
{
    *out << "{name \"" << texts.name << "\", dirpath \"" << texts.directory << "\", abspath \"" << texts.absolute
         << "\"}";
}

PathTexts textsOf(const IZELServerPath& path)
{
    ZELServerString name("stale");
    ZELServerString directory("stale");
    ZELServerString absolute("stale");
    path.getName(name);
    path.getDirectoryPath(directory);
    path.getAbsolutePath(absolute);
    return {name.str(), directory.str(), absolute.str()};
}

// A channel the readers can bind objects to; nothing is ever sent through it.
IZELServerChannel* fakeChannel(int n) { return reinterpret_cast<IZELServerChannel*>(static_cast<std::uintptr_t>(0x1000 * n)); }

// ---- Paths ------------------------------------------------------------------------------------------

struct WholePathCase {
    const char* whole;
    PathTexts expected;
};

void PrintTo(const WholePathCase& c, std::ostream* out) { *out << '"' << c.whole << '"'; }

class PathFromWholePath : public ::testing::TestWithParam<WholePathCase> {};

TEST_P(PathFromWholePath, SplitsAtTheLastSlash)
{
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    IZELServerPath* path = mountPoint->createPath(ZELServerString(GetParam().whole));
    ASSERT_NE(path, nullptr);
    EXPECT_EQ(textsOf(*path), GetParam().expected);
    mountPoint->releaseObject(path);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, PathFromWholePath,
    ::testing::Values(WholePathCase{"in/2024/data.csv", {"data.csv", "in/2024", "in/2024/data.csv"}},
                      WholePathCase{"data.csv", {"data.csv", "", "/data.csv"}},
                      WholePathCase{"/data.csv", {"data.csv", "", "/data.csv"}},
                      WholePathCase{"/in/data.csv", {"data.csv", "/in", "/in/data.csv"}},
                      WholePathCase{"in/", {"", "in", "in/"}},
                      WholePathCase{"a//b", {"b", "a/", "a/b"}},
                      WholePathCase{"in\\data.csv", {"in\\data.csv", "", "/in\\data.csv"}},
                      WholePathCase{"", {"", "", "/"}}));

struct PartsCase {
    const char* directory;
    const char* name;
    const char* absolute;
};

void PrintTo(const PartsCase& c, std::ostream* out) { *out << "(\"" << c.directory << "\", \"" << c.name << "\")"; }

class PathFromParts : public ::testing::TestWithParam<PartsCase> {};

TEST_P(PathFromParts, KeepsBothPartsAndJoinsThemWithOneSlash)
{
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    IZELServerPath* path = mountPoint->createPath(ZELServerString(GetParam().directory), ZELServerString(GetParam().name));
    ASSERT_NE(path, nullptr);
    EXPECT_EQ(textsOf(*path), (PathTexts{GetParam().name, GetParam().directory, GetParam().absolute}));
    mountPoint->releaseObject(path);
}

INSTANTIATE_TEST_SUITE_P(Texts, PathFromParts,
                         ::testing::Values(PartsCase{"in/2024", "data.csv", "in/2024/data.csv"},
                                           PartsCase{"in/2024/", "data.csv", "in/2024/data.csv"},
                                           PartsCase{"in", "/data.csv", "in/data.csv"},
                                           PartsCase{"in//", "//data.csv", "in/data.csv"},
                                           PartsCase{"", "data.csv", "/data.csv"},
                                           PartsCase{"/", "data.csv", "/data.csv"},
                                           PartsCase{"in", "", "in/"}));

// ---- File descriptions ------------------------------------------------------------------------------

std::string fileInfoReply(const std::string& elements) { return "<SR_LIST>" + elements + "</SR_LIST>"; }

TEST(FileInfoReader, ReadsTypeSizeDateAndThePathChild)
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
    EXPECT_EQ(textsOf(info.getPath()), (PathTexts{"out", "jobs/7", "jobs/7/out"}));
}

TEST(FileInfoReader, TakesThePathFromTheElementItselfWithoutAPathChild)
{
    ZELServerFileInfo info;
    ASSERT_EQ(readFileInfoReply(fileInfoReply(R"(<FILEINFO filetype="FILE" size="12" name="a.txt" dirpath="in" )"
                                              R"(abspath="in/a.txt"/>)"),
                                info),
              0);
    EXPECT_FALSE(info.isDirectory());
    EXPECT_EQ(info.getSize(), 12u);
    EXPECT_EQ(textsOf(info.getPath()), (PathTexts{"a.txt", "in", "in/a.txt"}));
}

TEST(FileInfoReader, OnlyTheExactTextDirIsADirectory)
{
    for (const char* type : {"dir", "Dir", "DIR ", " DIR", "DIRECTORY", "FILE", ""}) {
        ZELServerFileInfo info;
        ASSERT_EQ(readFileInfoReply(fileInfoReply(std::string(R"(<FILEINFO filetype=")") + type + R"("/>)"), info), 0);
        EXPECT_FALSE(info.isDirectory()) << "filetype \"" << type << "\"";
    }
    ZELServerFileInfo info;
    ASSERT_EQ(readFileInfoReply(fileInfoReply(R"(<FILEINFO filetype="DIR"/>)"), info), 0);
    EXPECT_TRUE(info.isDirectory());
}

struct SizeCase {
    const char* text;  // null: attribute absent
    unsigned expected;
};

void PrintTo(const SizeCase& c, std::ostream* out)
{
    *out << (c.text != nullptr ? '"' + std::string(c.text) + '"' : std::string("(absent)"));
}

class FileInfoSize : public ::testing::TestWithParam<SizeCase> {};

TEST_P(FileInfoSize, IsAnUnsignedNumberOrZero)
{
    ZELServerFileInfo info;
    const std::string attribute = GetParam().text ? std::string(R"( size=")") + GetParam().text + "\"" : "";
    ASSERT_EQ(readFileInfoReply(fileInfoReply("<FILEINFO filetype=\"FILE\"" + attribute + "/>"), info), 0);
    EXPECT_EQ(info.getSize(), GetParam().expected) << "size \"" << (GetParam().text ? GetParam().text : "(absent)") << "\"";
}

INSTANTIATE_TEST_SUITE_P(Texts, FileInfoSize,
                         ::testing::Values(SizeCase{"1024", 1024}, SizeCase{"  77", 77}, SizeCase{"0x10", 16},
                                           SizeCase{"0XfF", 255}, SizeCase{"4294967295", 4294967295u},
                                           SizeCase{"4294967296", 0}, SizeCase{"-1", 0}, SizeCase{"-0", 0},
                                           SizeCase{"12abc", 0}, SizeCase{"12.000", 12}, SizeCase{"", 0},
                                           SizeCase{nullptr, 0}));

TEST(FileInfoReader, FailuresLeaveTheDescriptionAlone)
{
    ZELServerFileInfo info;
    ASSERT_EQ(readFileInfoReply(fileInfoReply(R"(<FILEINFO filetype="DIR" size="9"/>)"), info), 0);
    EXPECT_EQ(readFileInfoReply("<SR_GET/>", info), static_cast<int>(msg::kUnreadableReply));
    EXPECT_EQ(readFileInfoReply("<SR_GET><fileinfo filetype=\"FILE\"/></SR_GET>", info),
              static_cast<int>(msg::kUnreadableReply));
    EXPECT_EQ(readFileInfoReply("true", info), static_cast<int>(msg::kXmlFailure));
    EXPECT_TRUE(info.isDirectory());
    EXPECT_EQ(info.getSize(), 9u);
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
    EXPECT_EQ(textsOf(infos.at(0)->getPath()).name, "a");
    EXPECT_TRUE(infos.at(0)->isDirectory());
    EXPECT_EQ(textsOf(infos.at(1)->getPath()).name, "b");
    EXPECT_EQ(infos.at(1)->getSize(), 3u);
    EXPECT_EQ(textsOf(infos.at(2)->getPath()).name, "c");
    EXPECT_EQ(infos.at(2)->getSize(), 4u);

    ASSERT_EQ(readFileInfosReply("<SR_LIST/>", infos), 0) << "an empty directory is a listing too";
    EXPECT_EQ(infos.entries(), 0u);

    infos.append(new ZELServerFileInfo());
    EXPECT_EQ(readFileInfosReply("not xml", infos), static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(infos.entries(), 1u) << "a body that does not parse leaves the list alone";
}

// ---- Shared resources -------------------------------------------------------------------------------

struct MountPointTexts {
    std::string name;
    std::string displayName;
    std::string description;
    bool operator==(const MountPointTexts&) const = default;
};

MountPointTexts textsOf(const IZELServerMountPoint& mountPoint)
{
    ZELServerString name("stale");
    ZELServerString displayName("stale");
    ZELServerString description("stale");
    mountPoint.getName(name);
    mountPoint.getDisplayName(displayName);
    mountPoint.getDescription(description);
    return {name.str(), displayName.str(), description.str()};
}

void PrintTo(const MountPointTexts& texts, std::ostream* out)
{
    *out << "{\"" << texts.name << "\", \"" << texts.displayName << "\", \"" << texts.description << "\"}";
}

TEST(SharedResourceReader, FillsTheMountPointAndBindsItToTheRepliesChannel)
{
    ZELServerMountPoint mountPoint(fakeChannel(1));
    ASSERT_EQ(readMountPointReply(R"(<SR_GET_SHAREDRESOURCE><SHAREDRESOURCE name="DATA" displayname="Input &amp; output" )"
                                  R"(description="Files the jobs read"/></SR_GET_SHAREDRESOURCE>)",
                                  fakeChannel(2), mountPoint),
              0);
    EXPECT_EQ(textsOf(mountPoint), (MountPointTexts{"DATA", "Input & output", "Files the jobs read"}));
    EXPECT_EQ(mountPoint.channel(), fakeChannel(2));
}

TEST(SharedResourceReader, AReplyWithoutTheElementLeavesTheMountPointAlone)
{
    ZELServerMountPoint mountPoint(fakeChannel(1));
    ASSERT_EQ(readMountPointReply(R"(<R><SHAREDRESOURCE name="A" displayname="B" description="C"/></R>)", fakeChannel(1),
                                  mountPoint),
              0);
    EXPECT_EQ(readMountPointReply("<SR_GET_SHAREDRESOURCE/>", fakeChannel(3), mountPoint),
              static_cast<int>(msg::kUnreadableReply));
    EXPECT_EQ(readMountPointReply("", fakeChannel(3), mountPoint), static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(textsOf(mountPoint), (MountPointTexts{"A", "B", "C"}));
    EXPECT_EQ(mountPoint.channel(), fakeChannel(1));
}

TEST(SharedResourceReader, AListMakesOneBoundMountPointPerElement)
{
    const std::unique_ptr<IZELServerVector<IZELServerMountPoint>> mountPoints(makeMountPointVector());
    mountPoints->append(makeMountPoint(nullptr));
    ASSERT_EQ(readMountPointsReply(R"(<SR_GET_SHAREDRESOURCES><SHAREDRESOURCE name="A" displayname="a" description=""/>)"
                                   R"(<SHAREDRESOURCE name="B" displayname="b" description="second"/></SR_GET_SHAREDRESOURCES>)",
                                   fakeChannel(4), *mountPoints),
              0);
    ASSERT_EQ(mountPoints->entries(), 2u);
    EXPECT_EQ(textsOf(*mountPoints->element(0)), (MountPointTexts{"A", "a", ""}));
    EXPECT_EQ(textsOf(*mountPoints->element(1)), (MountPointTexts{"B", "b", "second"}));
    for (unsigned i = 0; i < 2; ++i) {
        const auto* concrete = dynamic_cast<const ZELServerMountPoint*>(mountPoints->element(i));
        ASSERT_NE(concrete, nullptr);
        EXPECT_EQ(concrete->channel(), fakeChannel(4));
    }
}

TEST(SharedResourceReader, ReadFromXmlTakesTheElementThroughTheInterface)
{
    XmlReader reader;
    const StatusPtr failure(reader.parse(R"(<SHAREDRESOURCE name="N" displayname="D" description="X"/>)"));
    ASSERT_EQ(failure, nullptr);
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    mountPoint->readFromXML(*reader.rootOf()->node());
    EXPECT_EQ(textsOf(*mountPoint), (MountPointTexts{"N", "D", "X"}));
}

}  // namespace
}  // namespace zel
