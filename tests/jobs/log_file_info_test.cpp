// The log file description and its reader for the reply of "LOG_GET_FILEINFO".

#include "jobs/ZELServerLogFileInfo.h"

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "jobs/jobs_factories.h"

namespace zel {
namespace {

constexpr unsigned kFresh = 4294967295u;

TEST(LogFileInfo, FreshSizeIsAllBitsSet)
{
    ZELServerLogFileInfo info;
    EXPECT_EQ(info.getSize(), kFresh);
    std::unique_ptr<IZELServerLogFileInfo> made(makeLogFileInfo());
    ASSERT_NE(made, nullptr);
    EXPECT_EQ(made->getSize(), kFresh);
}

struct ReplyCase {
    const char* what;
    std::string body;
    int result;
    unsigned size;
};

class LogFileInfoReply : public ::testing::TestWithParam<ReplyCase> {};

TEST_P(LogFileInfoReply, ReadsTheSizeOfTheFirstChildNamedLogFileInfo)
{
    SCOPED_TRACE(GetParam().what);
    ZELServerLogFileInfo info;
    EXPECT_EQ(readLogFileInfoReply(GetParam().body, info), GetParam().result);
    EXPECT_EQ(info.getSize(), GetParam().size);
}

const int kNotXml = static_cast<int>(msg::kXmlFailure);

const ReplyCase kReplyCases[] = {
    {"plain", R"(<LOG_GET_FILEINFO><LOGFILEINFO size="120"/></LOG_GET_FILEINFO>)", 0, 120},
    {"name in lower case", R"(<R><logfileinfo size="120"/></R>)", 0, 120},
    {"name in mixed case", R"(<R><LogFileInfo size="7"/></R>)", 0, 7},
    {"with declaration and other children", R"(<?xml version="1.0"?><R><A/>text<LOGFILEINFO size="9"/></R>)", 0, 9},
    {"first of two", R"(<R><LOGFILEINFO size="1"/><LOGFILEINFO size="2"/></R>)", 0, 1},
    {"hexadecimal and blanks", R"(<R><LOGFILEINFO size=" 0x10 "/></R>)", 0, 16},
    {"zero fraction", R"(<R><LOGFILEINFO size="3.00"/></R>)", 0, 3},
    {"zero", R"(<R><LOGFILEINFO size="0"/></R>)", 0, 0},
    {"number then text keeps the number", R"(<R><LOGFILEINFO size="12abc"/></R>)", 0, 12},
    {"no number", R"(<R><LOGFILEINFO size="big"/></R>)", 0, kFresh},
    {"overflow", R"(<R><LOGFILEINFO size="4294967296"/></R>)", 0, kFresh},
    {"no size attribute", R"(<R><LOGFILEINFO/></R>)", 0, kFresh},
    {"attribute name is exact", R"(<R><LOGFILEINFO SIZE="5"/></R>)", 0, kFresh},
    {"no description at all still reads", R"(<R><OTHER size="5"/></R>)", 0, kFresh},
    {"document element is not searched", R"(<LOGFILEINFO size="5"/>)", 0, kFresh},
    {"grandchildren are not searched", R"(<R><X><LOGFILEINFO size="5"/></X></R>)", 0, kFresh},
    {"empty body", "", kNotXml, kFresh},
    {"not XML", "false", kNotXml, kFresh},
    {"unclosed", "<R><LOGFILEINFO size=\"5\"/>", kNotXml, kFresh},
};

INSTANTIATE_TEST_SUITE_P(Table, LogFileInfoReply, ::testing::ValuesIn(kReplyCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST(LogFileInfo, ForeignImplementationIsNotReadable)
{
    class Foreign final : public IZELServerLogFileInfo {
    public:
        unsigned getSize() const override { return 1; }
    } foreign;
    EXPECT_EQ(readLogFileInfoReply(R"(<R><LOGFILEINFO size="5"/></R>)", foreign), static_cast<int>(msg::kUnreadableReply));
}

TEST(LogFileInfo, ReadingAgainReplacesTheSize)
{
    ZELServerLogFileInfo info;
    ASSERT_EQ(readLogFileInfoReply(R"(<R><LOGFILEINFO size="5"/></R>)", info), 0);
    ASSERT_EQ(readLogFileInfoReply(R"(<R><LOGFILEINFO size="6"/></R>)", info), 0);
    EXPECT_EQ(info.getSize(), 6u);
    // A later reply without a description leaves what was read.
    ASSERT_EQ(readLogFileInfoReply(R"(<R/>)", info), 0);
    EXPECT_EQ(info.getSize(), 6u);
}

}  // namespace
}  // namespace zel
