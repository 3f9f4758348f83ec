// The local file of a transfer: each direction refuses the other one.

#include "transport/LocalFile.h"

#include <filesystem>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "support/environment.h"
#include "support/helpers.h"

namespace zel {
namespace {

namespace fs = std::filesystem;
using zeltest::slurp;

class LocalFileTest : public ::testing::Test {
protected:
    std::string make(const std::string& name, const std::string& content) const
    {
        zeltest::spew(dir / name, content);
        return (dir / name).string();
    }
    const zeltest::TempDir scratch{"zel-localfile"};
    const fs::path dir{scratch.path()};
};

TEST_F(LocalFileTest, EachModeRefusesTheOtherDirectionAndWritingStartsEmpty)
{
    LocalFile reader(make("r", "abc"), LocalFile::Mode::Read);
    EXPECT_FALSE(reader.write("x", 1));
    EXPECT_EQ(slurp(reader.path()), "abc");

    LocalFile writer(make("w", "old content"), LocalFile::Mode::Write);
    ASSERT_TRUE(writer.isOpen());
    EXPECT_EQ(fs::file_size(dir / "w"), 0u);
    char byte;
    EXPECT_EQ(writer.read(&byte, 1), std::nullopt);
    EXPECT_TRUE(writer.write("new", 3));
    EXPECT_TRUE(writer.close());
    EXPECT_FALSE(writer.isOpen());
    EXPECT_EQ(slurp(dir / "w"), "new");
}

}  // namespace
}  // namespace zel
