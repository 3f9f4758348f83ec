// Paths and file descriptions as objects: how paths are made, and what the "FILEINFO" reader makes of
// reply bodies, including after a failure.

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerMountPoint.h"
#include "sharedresources/shared_resource_readers.h"

namespace zel {
namespace {

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

std::string textsOf(const IZELServerFileInfo& info)
{
    return (info.isDirectory() ? "dir " : "file ") + std::to_string(info.getSize()) + " " + textsOf(info.getPath());
}

TEST(Path, AWholePathSplitsAtTheLastSlashAndPartsJoinWithOneSlash)
{
    ZELServerMountPoint area(nullptr);
    const std::pair<const char*, const char*> wholes[] = {
        {"in/2024/data.csv", "data.csv|in/2024|in/2024/data.csv"},
        {"data.csv", "data.csv||/data.csv"},
        {"a//b", "b|a/|a/b"},
        {"in\\data.csv", "in\\data.csv||/in\\data.csv"},
    };
    for (const auto& [whole, expected] : wholes) {
        const std::unique_ptr<IZELServerPath> path(area.createPath(ZELServerString(whole)));
        EXPECT_EQ(textsOf(*path), expected) << whole;
    }
    const std::pair<std::pair<const char*, const char*>, const char*> parts[] = {
        {{"in//", "//data.csv"}, "//data.csv|in//|in/data.csv"},
        {{"in", ""}, "|in|in/"},
    };
    for (const auto& [given, expected] : parts) {
        const std::unique_ptr<IZELServerPath> path(
            area.createPath(ZELServerString(given.first), ZELServerString(given.second)));
        EXPECT_EQ(textsOf(*path), expected) << given.first << " + " << given.second;
    }
}

TEST(FileInfoReader, ReadsTheFirstDescriptionAndAFailureLeavesTheLastOneRead)
{
    const struct {
        std::string body;
        int result;
        std::string after;
    } rows[] = {
        {R"(<SR_GET><FILEINFO filetype="DIR" size="0" name="wrong" dirpath="wrong" abspath="wrong">)"
         R"(<PATH name="out" dirpath="jobs/7" abspath="jobs/7/out"/></FILEINFO></SR_GET>)",
         0, "dir 0 out|jobs/7|jobs/7/out"},
        {R"(<R><FILEINFO filetype="DIR" size="9" name="a" dirpath="in" abspath="in/a"/></R>)", 0, "dir 9 a|in|in/a"},
        {"<SR_GET/>", static_cast<int>(msg::kUnreadableReply), "dir 9 a|in|in/a"},
        {R"(<R><fileinfo filetype="FILE"/></R>)", static_cast<int>(msg::kUnreadableReply), "dir 9 a|in|in/a"},
        {"true", static_cast<int>(msg::kXmlFailure), "dir 9 a|in|in/a"},
        // Only the exact text "DIR" is a directory; the size is an unsigned number or zero.
        {R"(<R><FILEINFO filetype="dir" size="0x10"/></R>)", 0, "file 16 ||"},
        {R"(<R><FILEINFO filetype="DIR " size="4294967295"/></R>)", 0, "file 4294967295 ||"},
        {R"(<R><FILEINFO filetype="DIR" size="4294967296"/></R>)", 0, "dir 0 ||"},
        {R"(<R><FILEINFO filetype="FILE" size="-1"/></R>)", 0, "file 0 ||"},
        {R"(<R><FILEINFO filetype="FILE" size="12abc"/></R>)", 0, "file 0 ||"},
    };
    ZELServerFileInfo info;
    for (const auto& row : rows) {
        EXPECT_EQ(readFileInfoReply(row.body, info), row.result) << row.body;
        EXPECT_EQ(textsOf(info), row.after) << row.body;
    }
}

}  // namespace
}  // namespace zel
