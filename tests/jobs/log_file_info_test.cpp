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
const int kNotXml = static_cast<int>(msg::kXmlFailure);

TEST(LogFileInfo, ReplyGivesTheSizeOfTheFirstChildNamedLogFileInfo)
{
    const struct {
        const char* what;
        std::string body;
        int result;
        unsigned size;
    } cases[] = {
        {"plain", R"(<LOG_GET_FILEINFO><LOGFILEINFO size="120"/></LOG_GET_FILEINFO>)", 0, 120},
        {"name in lower case", R"(<R><logfileinfo size="120"/></R>)", 0, 120},
        {"number then text keeps the number", R"(<R><LOGFILEINFO size="12abc"/></R>)", 0, 12},
        {"attribute name is exact", R"(<R><LOGFILEINFO SIZE="5"/></R>)", 0, kFresh},
        {"no description at all still reads", R"(<R><OTHER size="5"/></R>)", 0, kFresh},
        {"document element is not searched", R"(<LOGFILEINFO size="5"/>)", 0, kFresh},
        {"grandchildren are not searched", R"(<R><X><LOGFILEINFO size="5"/></X></R>)", 0, kFresh},
        {"empty body", "", kNotXml, kFresh},
    };
    for (const auto& c : cases) {
        ZELServerLogFileInfo info;  // a fresh description has all bits of its size set
        EXPECT_EQ(readLogFileInfoReply(c.body, info), c.result) << c.what;
        EXPECT_EQ(info.getSize(), c.size) << c.what;
    }
    std::unique_ptr<IZELServerLogFileInfo> made(makeLogFileInfo());
    ASSERT_NE(made, nullptr);
    EXPECT_EQ(made->getSize(), kFresh);
}

TEST(LogFileInfo, AForeignImplementationIsNotReadable)
{
    class Foreign final : public IZELServerLogFileInfo {
    public:
        unsigned getSize() const override { return 1; }
    } foreign;
    EXPECT_EQ(readLogFileInfoReply(R"(<R><LOGFILEINFO size="5"/></R>)", foreign),
              static_cast<int>(msg::kUnreadableReply));
}

}  // namespace
}  // namespace zel
