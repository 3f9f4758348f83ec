// The job result text: entries into properties, the split of "result", and the job status words.
// Pure functions over bytes, so every case is a row of a table.

#include "jobs/result_text.h"

#include <optional>
#include <string>

#include <gtest/gtest.h>

using namespace std::string_literals;

namespace zel {
namespace {

TEST(ResultText, EntriesGiveExactlyTheseProperties)
{
    const struct {
        const char* what;
        std::string text;
        ResultProperties expected;
    } cases[] = {
        {"empty text", "", {}},
        {"equals inside the value", "request=a=b=c"s, {{"*request", "a=b=c"}}},
        {"entry without equals skipped", "junk\0x=1\0more junk"s, {{"*x", "1"}}},
        {"later entry replaces", "x=1\0y=2\0x=3"s, {{"*x", "3"}, {"*y", "2"}}},
        {"a name with its own star gets a second one", "*x=1"s, {{"**x", "1"}}},
        {"result with status and a pair",
         "result=12:Done|a=b"s,
         {{"*result", "12:Done|a=b"}, {"StatusNumber", "12"}, {"StatusMessage", "Done"}, {"a", "b"}}},
        {"empty side keeps the earlier value",
         "result=1:A|:B|2:"s,
         {{"*result", "1:A|:B|2:"}, {"StatusNumber", "2"}, {"StatusMessage", "B"}}},
        {"first piece without colon ends the status run", "result=x|1:A"s, {{"*result", "x|1:A"}}},
        {"status after a pair is ignored, pairs anywhere count",
         "result=1:A|k=v|2:B|m=n"s,
         {{"*result", "1:A|k=v|2:B|m=n"}, {"StatusNumber", "1"}, {"StatusMessage", "A"}, {"k", "v"}, {"m", "n"}}},
        {"a piece with colon and equals is a pair", "result=1:a=b"s, {{"*result", "1:a=b"}, {"1:a", "b"}}},
        {"piece overwriting the result itself", "result=*result=z|k=v"s, {{"*result", "z"}, {"k", "v"}}},
        {"pieces do not overwrite text entries",
         "a=text\0result=a=piece"s,
         {{"*a", "text"}, {"*result", "a=piece"}, {"a", "piece"}}},
    };
    for (const auto& c : cases) {
        ResultProperties properties;
        parseResultEntries(c.text, properties);
        splitResultValue(properties);
        EXPECT_EQ(properties, c.expected) << c.what;
    }
}

TEST(ResultText, ParsingAddsToExistingPropertiesAndSplittingNeedsThePrefixedResult)
{
    ResultProperties properties{{"*kept", "1"}, {"*x", "old"}};
    parseResultEntries("x=new\0y=2"s, properties);
    EXPECT_EQ(properties, (ResultProperties{{"*kept", "1"}, {"*x", "new"}, {"*y", "2"}}));

    ResultProperties unprefixed{{"result", "1:A"}};
    splitResultValue(unprefixed);
    EXPECT_EQ(unprefixed, (ResultProperties{{"result", "1:A"}}));
}

TEST(ResultText, JobStatusWordsMapToTheirCodesAndBack)
{
    const struct {
        const char* word;
        int code;  // -1: not a status word
    } cases[] = {
        {"SUBMITTED", 0}, {"QUEUED", 1},   {"DELAYED", 2},   {"PAUSED", 3},      {"IN_PROCESS", 4},
        {"DELETED", 5},   {"ABORTED", 6},  {"SUCCESS", 7},   {"ZEL_FAILURE", 8}, {"JOB_FAILURE", 9},
        {"PULLED", 10},   {"success", -1}, {"SUCCESS ", -1}, {"", -1},
    };
    for (const auto& c : cases) {
        const std::optional<unsigned> code = jobStatusCode(c.word);
        if (c.code < 0) {
            EXPECT_FALSE(code.has_value()) << c.word;
            continue;
        }
        ASSERT_TRUE(code.has_value()) << c.word;
        EXPECT_EQ(*code, static_cast<unsigned>(c.code));
        EXPECT_STREQ(jobStatusWord(*code), c.word);
    }
    EXPECT_EQ(jobStatusWord(11), nullptr);
    EXPECT_EQ(jobStatusWord(0xFFFFFFFFu), nullptr);
}

}  // namespace
}  // namespace zel
