// The job result object: what each getter finds in a result text, and what it leaves in its out
// value when it finds nothing. One row per getter and text.

#include "jobs/ZELServerTransformationResult.h"

#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "jobs/result_text.h"
#include "support/wire_table.h"

using namespace std::string_literals;

namespace zel {
namespace {

using Result = ZELServerTransformationResult;
using Read = std::function<std::string(const Result&)>;

// "found value"; the value starts as 77 (a number) or "before" (a text) so that one left alone shows.
Read number(unsigned (Result::*get)(unsigned&) const)
{
    return [get](const Result& result) {
        unsigned value = 77;
        const unsigned found = (result.*get)(value);
        return std::to_string(found) + " " + std::to_string(value);
    };
}
Read text(unsigned (Result::*get)(IZELServerString&) const)
{
    return [get](const Result& result) {
        ZELServerString value("before");
        const unsigned found = (result.*get)(value);
        return std::to_string(found) + " " + value.str();
    };
}
Read generic(unsigned (Result::*get)(const std::string&, std::string&) const, const char* name)
{
    return [get, name](const Result& result) {
        std::string value = "before";
        const unsigned found = (result.*get)(name, value);
        return std::to_string(found) + " " + value;
    };
}
template <class Value>
Read byName(unsigned (Result::*get)(const IZELServerString&, Value&) const, const char* name)
{
    return [get, name](const Result& result) {
        Value value{77};
        const unsigned found = (result.*get)(ZELServerString(name), value);
        return std::to_string(found) + " " + std::to_string(value);
    };
}
Read strings(void (Result::*get)(IZELServerStringArray&) const)
{
    return [get](const Result& result) {
        ZELServerStringArray all(std::vector<std::string>{"kept"});
        (result.*get)(all);
        return zeltest::joined(all.entries(), [&](std::size_t i) { return all.items()[i]; });
    };
}
// Job status, then whether it is a success.
const Read kJobStatus = [](const Result& result) {
    return number(&Result::getJobStatus)(result) + " " + std::to_string(result.isSuccess());
};
// The generic boolean, then the two success getters, which answer the value itself.
const Read kSuccesses = [](const Result& result) {
    return byName<unsigned>(&Result::getBoolProperty, "resultSuccess")(result) + " " +
           std::to_string(result.getResultSuccess()) + std::to_string(result.getServiceSuccess());
};

TEST(TransformationResult, EveryGetterReadsItsOwnEntry)
{
    const std::string all = "result=0:ok\0serviceMsg=a=b\0timeRequested=1\0timeStarted=2\0timeFinished=3\0"
                            "requesterHost=10.0.0.1\0request=R/w/w.zlw -XML_PARAMETER x\0requestKeyword=svc\0"
                            "description=nightly\0priority=3"s;
    const std::string pieces = "x=1\0priority=1\0result=12:Done|a=b|priority=9"s;
    const struct {
        std::string text;
        Read read;
        std::string expected;
    } rows[] = {
        {"id=17", number(&Result::getID), "1 17"},
        {"id=-1", number(&Result::getID), "1 4294967295"},  // a minus wraps like the server's reader
        {"id=12abc", number(&Result::getID), "0 12"},       // text behind the number: stored, not found
        {"id=4294967296", number(&Result::getID), "0 77"},
        {"requesterResultPort=-1", number(&Result::getRequesterResultPort), "0 77"},
        {all, number(&Result::getPriority), "1 3"},
        {"result=42:Finished|x=y", number(&Result::getStatusNumber), "1 42"},
        {"result=42:Finished|x=y", text(&Result::getStatusMessage), "1 Finished"},
        {all, text(&Result::getResult), "1 0:ok"},
        {all, text(&Result::getServiceMessage), "1 a=b"},
        {all, text(&Result::getTimeRequested), "1 1"},
        {all, text(&Result::getTimeStarted), "1 2"},
        {all, text(&Result::getTimeFinished), "1 3"},
        {all, text(&Result::getRequesterHost), "1 10.0.0.1"},
        {all, text(&Result::getRequest), "1 R/w/w.zlw -XML_PARAMETER x"},
        {all, text(&Result::getRequestKeyword), "1 svc"},
        {all, text(&Result::getDescription), "1 nightly"},
        {"", text(&Result::getRequest), "0 before"},
        {"description=null", text(&Result::getDescription), "0 null"},  // not a description, still handed out
        {"jobStatus=SUCCESS\0id=17"s, kJobStatus, "1 7 1"},
        {"jobStatus=QUEUED", kJobStatus, "1 1 0"},
        {"jobStatus=success", kJobStatus, "0 77 0"},
        {"resultSuccess=true\0serviceSuccess=Yes"s, kSuccesses, "1 1 11"},
        {"resultSuccess=No\0serviceSuccess=0.0"s, kSuccesses, "1 0 00"},
        {"resultSuccess=abc\0serviceSuccess=abc"s, kSuccesses, "0 77 00"},
        {"id=1", kSuccesses, "0 77 00"},
        // Generic names are found with and without the prefix; "result" pieces shadow text entries.
        {pieces, generic(&Result::findProperty, "x"), "1 1"},
        {pieces, generic(&Result::lookupProperty, "a"), "1 b"},
        {pieces, byName<unsigned>(&Result::getUIntProperty, "priority"), "1 9"},
        {pieces, number(&Result::getPriority), "1 1"},
        {"n=0x20", byName<unsigned>(&Result::getUIntProperty, "n"), "1 32"},
        {"f=-2e3", byName<float>(&Result::getFloatProperty, "f"), "1 -2000.000000"},
        {"f=1.5x", byName<float>(&Result::getFloatProperty, "f"), "0 77.000000"},
        {"zeta=1\0*odd=2\0result=3:M|a=b"s, strings(&Result::getPropertyNames),
         "kept,odd,result,zeta,StatusMessage,StatusNumber,a,"},
        {"zeta=1\0result=3:M"s, strings(&Result::getProperties),
         "kept,result,3:M,zeta,1,StatusMessage,M,StatusNumber,3,"},
    };
    for (const auto& row : rows) {
        Result result;
        result.parse(ZELServerString(row.text));
        EXPECT_EQ(row.read(result), row.expected) << row.text;
    }
}

TEST(TransformationResult, ParsingAgainAddsAndOverwritesButNeverRemoves)
{
    Result result;
    ZELServerString text("before");
    result.getText(text);
    EXPECT_EQ(text.str(), "");
    EXPECT_EQ(result.isSuccess(), 0u);
    result.parse(ZELServerString("a=1\0b=2"s));
    result.parse(ZELServerString("b=3\0c=4"s));
    result.getText(text);
    EXPECT_EQ(text.str(), "b=3\0c=4"s);
    EXPECT_EQ(result.properties(), (ResultProperties{{"*a", "1"}, {"*b", "3"}, {"*c", "4"}}));
    result.parse(ZELServerString(""));
    result.getText(text);
    EXPECT_EQ(text.str(), "");
    EXPECT_EQ(result.properties().size(), 3u);
}

// The job result text: entries into properties and the split of "result".
TEST(ResultText, EntriesGiveExactlyTheseProperties)
{
    const struct {
        const char* what;
        std::string text;
        ResultProperties expected;
    } cases[] = {
        {"empty text", "", {}},
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

}  // namespace
}  // namespace zel
