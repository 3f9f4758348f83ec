// The path resolver of shared resources, without a server.
#include <gtest/gtest.h>

#include <filesystem>

#include "shared_resources.h"
#include "support/server_fixture.h"

namespace zeltest {
namespace {

namespace fs = std::filesystem;

class Paths : public ::testing::Test {
 protected:
  void SetUp() override {
    root_ = makeTempDir();
    fs::create_directories(root_ + "/area/sub");
    std::string error;
    area_ = std::make_unique<zelserverd::SharedArea>(
        zelserverd::SharedResourceConfig{"A", root_ + "/area", "A", ""}, error);
    ASSERT_EQ(error, "");
    real_ = fs::canonical(root_ + "/area").string();
  }
  void TearDown() override { removeTree(root_); }

  std::string root_;
  std::string real_;
  std::unique_ptr<zelserverd::SharedArea> area_;
};

TEST_F(Paths, NormalisesAndMapsEveryComponent) {
  struct Case {
    const char* client;
    const char* relative;
  };
  const Case cases[] = {
      {"", ""},
      {".", ""},
      {"sub", "sub"},
      {"sub//./file.txt", "sub/file.txt"},
      {"sub\\x\\y", "sub/x/y"},
      {"missing/deeper/still", "missing/deeper/still"},
      {"a..b/..c", "a..b/..c"},
      {"/sub/file.txt", "sub/file.txt"},
      {"/", ""},
  };
  for (const Case& c : cases) {
    zelserverd::AreaPath path;
    ASSERT_EQ(area_->resolve(c.client, path), "") << c.client;
    EXPECT_EQ(path.relative, c.relative);
    EXPECT_EQ(path.full, std::string(c.relative).empty() ? real_ : real_ + "/" + c.relative);
  }
}

TEST_F(Paths, LinkTargetsAreCheckedWhereverTheLinkStands) {
  fs::create_directories(root_ + "/out");
  fs::create_directory_symlink(root_ + "/out", root_ + "/area/sub/out");
  fs::create_directory_symlink("..", root_ + "/area/sub/up");
  fs::create_directory_symlink(".", root_ + "/area/sub/self");
  zelserverd::AreaPath path;
  EXPECT_EQ(area_->resolve("sub/out/new/file", path),
            "symbolic link 'sub/out' points outside shared resource 'A'");
  EXPECT_EQ(area_->resolve("sub/up/sub", path), "");
  EXPECT_EQ(area_->resolve("sub/up/sub/up/up", path), "");
  EXPECT_EQ(area_->resolve("sub/self/self/x", path), "");
}

TEST(PathDocument, ReadsAbspathOrJoinsItsParts) {
  struct Case {
    const char* doc;
    const char* path;
    const char* error;
  };
  const Case cases[] = {
      {"<R><PATH name=\"n\" dirpath=\"d\" abspath=\"x/y\"/></R>", "x/y", ""},
      {"<R><PATH name=\"n\" dirpath=\"d\" abspath=\"\"/></R>", "d/n", ""},
      {"<R><PATH name=\"n\"/></R>", "n", ""},
      {"<PATH abspath=\"top\"/>", "top", ""},
      {"<R><X><PATH abspath=\"deep\"/></X></R>", "deep", ""},
      {"<R/>", "", "path value holds no PATH element"},
      {"", "", "path value is not a PATH document: malformed XML: No document element found"},
  };
  for (const Case& c : cases) {
    std::string path;
    EXPECT_EQ(zelserverd::pathFromDocument(c.doc, path), c.error) << c.doc;
    EXPECT_EQ(path, c.path) << c.doc;
  }
}

}  // namespace
}  // namespace zeltest
