// The local file of a transfer: opening for either direction, size, chunked reading and writing,
// and the checksum read afresh from disk.

#include "transport/LocalFile.h"

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "support/environment.h"
#include "support/helpers.h"
#include "support/fake_server.h"

namespace zel {
namespace {

namespace fs = std::filesystem;

// The fake server's bitwise CRC-32 checks the library's table-driven one.
using zeltest::crc32;
using zeltest::pattern;
using zeltest::slurp;

class LocalFileTest : public ::testing::Test {
protected:
    std::string make(const std::string& name, const std::string& content) const
    {
        const fs::path path = dir / name;
        std::ofstream(path, std::ios::binary) << content;
        return path.string();
    }
    const zeltest::TempDir scratch{"zel-localfile"};
    const fs::path dir{scratch.path()};
};

TEST_F(LocalFileTest, OpenFailsForAMissingFileOrAnUnwritablePath)
{
    EXPECT_FALSE(LocalFile((dir / "absent").string(), LocalFile::Mode::Read).isOpen());
    EXPECT_FALSE(LocalFile((dir / "no" / "such" / "dir" / "f").string(), LocalFile::Mode::Write).isOpen());
    EXPECT_FALSE(fs::exists(dir / "absent"));
}

TEST_F(LocalFileTest, WriteModeCreatesOrEmptiesTheFile)
{
    const std::string path = make("f", "old content");
    LocalFile file(path, LocalFile::Mode::Write);
    ASSERT_TRUE(file.isOpen());
    EXPECT_EQ(fs::file_size(path), 0u);
    EXPECT_TRUE(file.write("new", 3));
    EXPECT_TRUE(file.close());
    EXPECT_FALSE(file.isOpen());
    EXPECT_EQ(slurp(path), "new");

    LocalFile fresh((dir / "created").string(), LocalFile::Mode::Write);
    EXPECT_TRUE(fresh.isOpen());
    EXPECT_TRUE(fs::exists(dir / "created"));
}

TEST_F(LocalFileTest, SizeOfAFileBeyondFourGibibytes)
{
    const std::string path = make("sparse", "");
    const std::uint64_t size = (std::uint64_t{5} << 30) + 3;
    std::error_code error;
    fs::resize_file(path, size, error);
    if (error) {
        GTEST_SKIP() << "no sparse files here: " << error.message();
    }
    LocalFile file(path, LocalFile::Mode::Read);
    EXPECT_EQ(file.size(), std::optional<std::uint64_t>(size));
}

TEST_F(LocalFileTest, EachDirectionRefusesTheOther)
{
    LocalFile reader(make("r", "abc"), LocalFile::Mode::Read);
    EXPECT_FALSE(reader.write("x", 1));
    EXPECT_EQ(slurp(reader.path()), "abc");

    LocalFile writer((dir / "w").string(), LocalFile::Mode::Write);
    char byte;
    EXPECT_EQ(writer.read(&byte, 1), std::nullopt);
}

TEST_F(LocalFileTest, ChecksumMatchesTheStandardCrc32)
{
    struct Case {
        const char* name;
        std::string content;
        std::uint32_t crc;
    };
    const Case cases[] = {
        {"empty", "", 0},
        {"check value", "123456789", 0xCBF43926u},
        {"one byte", "a", 0xE8B7BE43u},
    };
    for (const Case& c : cases) {
        LocalFile file(make(c.name, c.content), LocalFile::Mode::Read);
        EXPECT_EQ(file.crc32(), std::optional<std::uint32_t>(c.crc)) << c.name;
    }
    // Longer than any block size the checksum pass could use, and not a multiple of one.
    const std::string big = pattern(1234567);
    LocalFile file(make("big", big), LocalFile::Mode::Read);
    EXPECT_EQ(file.crc32(), std::optional<std::uint32_t>(crc32(big)));
}

TEST_F(LocalFileTest, ChecksumReadsTheFileAfreshThroughItsPath)
{
    const std::string path = make("f", "first");
    LocalFile file(path, LocalFile::Mode::Read);
    char buffer[2];
    ASSERT_EQ(file.read(buffer, 2), std::optional<std::size_t>(2));
    std::ofstream(path, std::ios::binary | std::ios::app) << "-and-more";
    EXPECT_EQ(file.crc32(), std::optional<std::uint32_t>(crc32("first-and-more")));
    // The open stream is not disturbed by the checksum pass.
    ASSERT_EQ(file.read(buffer, 2), std::optional<std::size_t>(2));
    EXPECT_EQ(std::string(buffer, 2), "rs");

    // Windows refuses to remove a file that is open, so the stream goes first; the checksum still
    // goes by the path, and finds nothing there.
    ASSERT_TRUE(file.close());
    ASSERT_TRUE(fs::remove(path));
    EXPECT_EQ(file.crc32(), std::nullopt);
}

}  // namespace
}  // namespace zel
