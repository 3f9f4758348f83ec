// The local file of a transfer: each direction, and the checksum read afresh
// from disk.

#include "transport/LocalFile.h"

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "support/environment.h"
#include "support/fake_server.h"
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

// The fake server's bitwise CRC-32 checks the library's table-driven one.
TEST_F(LocalFileTest, ChecksumIsTheStandardCrc32ReadAfreshThroughThePath)
{
    // Longer than any block size the checksum pass could use, and not a multiple of one.
    const std::string big = zeltest::pattern(1234567);
    EXPECT_EQ(LocalFile(make("big", big), LocalFile::Mode::Read).crc32(), zeltest::crc32(big));

    const std::string path = make("f", "first");
    LocalFile file(path, LocalFile::Mode::Read);
    char buffer[2];
    ASSERT_EQ(file.read(buffer, 2), std::optional<std::size_t>(2));
    std::ofstream(path, std::ios::binary | std::ios::app) << "-and-more";
    EXPECT_EQ(file.crc32(), std::optional<std::uint32_t>(zeltest::crc32("first-and-more")));
    // The open stream is not disturbed by the checksum pass.
    ASSERT_EQ(file.read(buffer, 2), std::optional<std::size_t>(2));
    EXPECT_EQ(std::string(buffer, 2), "rs");
    // Windows refuses to remove an open file, so the stream goes first; the checksum still goes by
    // the path, and finds nothing there.
    ASSERT_TRUE(file.close());
    ASSERT_TRUE(fs::remove(path));
    EXPECT_EQ(file.crc32(), std::nullopt);
}

}  // namespace
}  // namespace zel
