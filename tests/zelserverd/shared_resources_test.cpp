// Shared resources: no command reaches outside the area, whatever the path or the links in it.
#include <gtest/gtest.h>

#include <filesystem>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

namespace fs = std::filesystem;

class Shared : public ServerFixture {
protected:
    void SetUp() override
    {
        ServerFixture::SetUp();
        ann_ = connectAs("ann");
    }
    WireReply onPath(const std::string& keyword, const std::string& path)
    {
        return ann_->command(keyword, {{"srName", "AREA"}, {"srPath", pathDocument(path)}});
    }
    WireReply twoPaths(const std::string& keyword, const std::string& from, const std::string& to)
    {
        return ann_->command(keyword,
                             {{"srName", "AREA"}, {"srSrcPath", pathDocument(from)}, {"srDestPath", pathDocument(to)}});
    }
    WireReply upload(const std::string& path, const std::string& content)
    {
        return ann_->upload("SR_UPLOAD", {{"srName", "AREA"}, {"srDestPath", pathDocument(path)}}, content);
    }
    Download download(const std::string& path)
    {
        return ann_->download("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument(path)}});
    }

    std::unique_ptr<TestClient> ann_;
};

// A "FILEINFO" element as the server writes it, with its time stamp made "TIME".
std::string fileInfo(const std::string& type, const std::string& size, const std::string& name, const std::string& dir)
{
    std::string path =
        "name=\"" + name + "\" dirpath=\"" + dir + "\" abspath=\"" + (dir.empty() ? name : dir + "/" + name) + "\"";
    return "<FILEINFO filetype=\"" + type + "\" size=\"" + size + "\" date=\"TIME\" " + path + "><PATH " + path +
           "/></FILEINFO>";
}

TEST_F(Shared, PathsCannotLeaveTheArea)
{
    std::string outside = root_ + "/outside";
    fs::create_directories(outside);
    spew(outside + "/secret.txt", "secret");
    fs::create_directory_symlink(outside, areaDir_ + "/escape");
    fs::create_symlink(outside + "/secret.txt", areaDir_ + "/secret-link");
    fs::create_symlink(root_ + "/nowhere", areaDir_ + "/dangling");
    fs::create_directories(areaDir_ + "/inner");
    fs::create_directory_symlink(areaDir_ + "/inner", areaDir_ + "/inner-link");

    const std::pair<std::string, std::string> cases[] = {
        {"../outside/secret.txt", "path '../outside/secret.txt' may not contain '..'"},
        {"inner/../../outside", "path 'inner/../../outside' may not contain '..'"},
        {"inner\\..\\..\\x", "path 'inner\\..\\..\\x' may not contain '..'"},
        {"\\\\host\\share", "absolute path '\\\\host\\share' is not allowed"},
        {"/../outside/secret.txt", "path '/../outside/secret.txt' may not contain '..'"},
        {"C:\\Windows", "absolute path 'C:\\Windows' is not allowed"},
        {"escape/secret.txt", "symbolic link 'escape' points outside shared resource 'AREA'"},
        {"secret-link", "symbolic link 'secret-link' points outside shared resource 'AREA'"},
        {"dangling", "symbolic link 'dangling' points outside shared resource 'AREA'"},
    };
    for (const auto& [path, expected] : cases) {
        for (const char* keyword : {"SR_EXISTS", "SR_GET", "SR_LIST", "SR_MAKE", "SR_DELETE"})
            EXPECT_EQ(onPath(keyword, path).body, expected) << keyword;
        EXPECT_EQ(upload(path, "x").body, expected);
        EXPECT_EQ(twoPaths("SR_COPY", "inner", path).body, expected);
        EXPECT_EQ(twoPaths("SR_MOVE", path, "inner/x").body, expected);
        Download down = download(path);
        EXPECT_FALSE(down.gotFile);
        EXPECT_EQ(down.reply.body, expected);
    }
    EXPECT_EQ(entriesOf(outside), std::vector<std::string>{"secret.txt"});
    EXPECT_EQ(slurp(outside + "/secret.txt"), "secret");
    // A link that stays inside the area is fine, and the listing leaves out links that point outside.
    EXPECT_TRUE(upload("inner-link/ok.txt", "ok").ok());
    EXPECT_EQ(slurp(areaDir_ + "/inner/ok.txt"), "ok");
    EXPECT_EQ(withoutTimes(onPath("SR_LIST", "").body),
              document("<SR_LIST>" + fileInfo("DIR", "0", "inner", "") + fileInfo("DIR", "0", "inner-link", "") +
                       "</SR_LIST>"));
}

}  // namespace
}  // namespace zeltest
