// The job result object: typed getters over the parsed properties, the found flags and what they
// leave in the out arguments.

#include "jobs/ZELServerTransformationResult.h"

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "jobs/jobs_factories.h"

using namespace std::string_literals;

namespace zel {
namespace {

using Result = ZELServerTransformationResult;
constexpr unsigned kUntouched = 0xDEADBEEFu;

std::unique_ptr<Result> parsed(const std::string& text)
{
    auto result = std::make_unique<Result>();
    result->parse(ZELServerString(text));
    return result;
}

// ---- Numbers

TEST(TransformationResult, UnsignedGettersConvertLikeTheServerWritesNumbers)
{
    using Getter = unsigned (Result::*)(unsigned&) const;
    const Getter id = &Result::getID;
    const Getter port = &Result::getRequesterResultPort;  // refuses a minus sign
    const struct {
        Getter get;
        std::string text;
        unsigned found;
        unsigned value;  // kUntouched when the out value must stay as it was
    } cases[] = {
        {id, "id=17", 1, 17},
        {id, "id=-1", 1, 4294967295u},  // a minus wraps like the server's reader
        // other text behind the number: stored, not found
        {id, "id=12abc", 0, 12},
        {port, "requesterResultPort=80x", 0, 80},
        {id, "id=4294967296", 0, kUntouched},
        {id, "other=1", 0, kUntouched},
        {id, "result=id=5", 0, kUntouched},  // a result piece is not the job's id
        {port, "requesterResultPort=7071", 1, 7071},
        {port, "requesterResultPort=-1", 0, kUntouched},
    };
    for (const auto& c : cases) {
        const auto result = parsed(c.text);
        unsigned value = kUntouched;
        EXPECT_EQ(((*result).*c.get)(value), c.found) << c.text;
        EXPECT_EQ(value, c.value) << c.text;
    }
}

TEST(TransformationResult, PriorityStatusNumberAndMessageUseTheirOwnNames)
{
    const auto result = parsed("priority=3\0result=42:Finished|x=y"s);
    unsigned priority = kUntouched;
    unsigned number = kUntouched;
    EXPECT_EQ(result->getPriority(priority), 1u);
    EXPECT_EQ(priority, 3u);
    EXPECT_EQ(result->getStatusNumber(number), 1u);
    EXPECT_EQ(number, 42u);
    ZELServerString message;
    EXPECT_EQ(result->getStatusMessage(message), 1u);
    EXPECT_EQ(message.str(), "Finished");
}

// ---- Job status and booleans

TEST(TransformationResult, JobStatusComparesTheWholeWordExactly)
{
    const struct {
        std::string text;
        unsigned found;
        unsigned code;
        unsigned success;
    } cases[] = {
        {"jobStatus=SUCCESS\0id=17"s, 1, 7, 1},
        {"jobStatus=QUEUED", 1, 1, 0},
        {"jobStatus=success", 0, kUntouched, 0},
        {"id=1", 0, kUntouched, 0},
    };
    for (const auto& c : cases) {
        const auto result = parsed(c.text);
        unsigned code = kUntouched;
        EXPECT_EQ(result->getJobStatus(code), c.found) << c.text;
        EXPECT_EQ(code, c.code) << c.text;
        EXPECT_EQ(result->isSuccess(), c.success) << c.text;
    }
}

TEST(TransformationResult, BooleansReadFirstLetterOrNumber)
{
    const struct {
        std::string value;
        unsigned found;
        unsigned flag;
    } cases[] = {
        {"true", 1, 1}, {"No", 1, 0}, {"2.5", 1, 1}, {"0.0", 1, 0}, {"abc", 0, 0}, {"", 0, 0},
    };
    for (const auto& c : cases) {
        const auto result = parsed("resultSuccess=" + c.value + "\0serviceSuccess="s + c.value);
        unsigned flag = kUntouched;
        EXPECT_EQ(result->getBoolProperty(std::string("resultSuccess"), flag), c.found) << c.value;
        EXPECT_EQ(flag, c.found ? c.flag : kUntouched) << c.value;
        // The two success getters answer the value itself, and 0 for what does not convert.
        EXPECT_EQ(result->getResultSuccess(), c.flag) << c.value;
        EXPECT_EQ(result->getServiceSuccess(), c.flag) << c.value;
    }
    const auto missing = parsed("id=1");
    EXPECT_EQ(missing->getResultSuccess(), 0u);
    EXPECT_EQ(missing->getServiceSuccess(), 0u);
}

// ---- Texts

TEST(TransformationResult, TextGettersReadTheirProperty)
{
    const auto result =
        parsed("result=0:ok\0serviceMsg=a=b\0timeRequested=20240102\0timeStarted=20240103\0timeFinished=20240104\0"
               "requesterHost=10.0.0.1\0request=R/w/w.zlw -XML_PARAMETER x\0requestKeyword=svc\0description=nightly"s);
    const struct {
        const char* what;
        unsigned (Result::*get)(IZELServerString&) const;
        const char* expected;
    } getters[] = {
        {"result", &Result::getResult, "0:ok"},
        {"serviceMsg", &Result::getServiceMessage, "a=b"},
        {"timeRequested", &Result::getTimeRequested, "20240102"},
        {"timeStarted", &Result::getTimeStarted, "20240103"},
        {"timeFinished", &Result::getTimeFinished, "20240104"},
        {"requesterHost", &Result::getRequesterHost, "10.0.0.1"},
        {"request", &Result::getRequest, "R/w/w.zlw -XML_PARAMETER x"},
        {"requestKeyword", &Result::getRequestKeyword, "svc"},
        {"description", &Result::getDescription, "nightly"},
    };
    const auto empty = parsed("");
    for (const auto& getter : getters) {
        ZELServerString out;
        EXPECT_EQ(((*result).*getter.get)(out), 1u) << getter.what;
        EXPECT_EQ(out.str(), getter.expected) << getter.what;
        ZELServerString untouched("before");
        EXPECT_EQ(((*empty).*getter.get)(untouched), 0u) << getter.what;
        EXPECT_EQ(untouched.str(), "before") << getter.what;
    }
    // A description of "null" is not found, but still written.
    ZELServerString out("before");
    EXPECT_EQ(parsed("description=null")->getDescription(out), 0u);
    EXPECT_EQ(out.str(), "null");
}

// ---- Generic lookup

TEST(TransformationResult, GenericNamesAreFoundWithAndWithoutPrefixAndPiecesShadowTextEntries)
{
    const auto result = parsed("x=1\0priority=1\0result=12:Done|a=b|priority=9"s);
    std::string value;
    EXPECT_EQ(result->findProperty("x", value), 1u);
    EXPECT_EQ(value, "1");
    EXPECT_EQ(result->findProperty("*x", value), 1u);
    EXPECT_EQ(result->lookupProperty("a", value), 1u);
    EXPECT_EQ(value, "b");
    value = "before";
    EXPECT_EQ(result->findProperty("y", value), 0u);
    EXPECT_EQ(value, "before");
    ZELServerString out;
    EXPECT_EQ(result->getStringProperty(ZELServerString("a"), out), 1u);
    EXPECT_EQ(out.str(), "b");

    // A "result" piece is stored without the prefix and is looked up first; the typed getter for the
    // text's own entry still reads the prefixed one.
    unsigned generic = 0;
    unsigned typed = 0;
    EXPECT_EQ(result->getUIntProperty(ZELServerString("priority"), generic), 1u);
    EXPECT_EQ(generic, 9u);
    EXPECT_EQ(result->getPriority(typed), 1u);
    EXPECT_EQ(typed, 1u);
}

TEST(TransformationResult, GenericNumbersFloatsAndBooleansByInterfaceName)
{
    const auto result = parsed("n=0x20\0b=no"s);
    unsigned n = 0;
    unsigned b = kUntouched;
    EXPECT_EQ(result->getUIntProperty(ZELServerString("n"), n), 1u);
    EXPECT_EQ(n, 32u);
    EXPECT_EQ(result->getBoolProperty(ZELServerString("b"), b), 1u);
    EXPECT_EQ(b, 0u);
    unsigned anyBase = kUntouched;
    EXPECT_EQ(result->getUIntPropertyAnyBase("n", anyBase), 1u);
    EXPECT_EQ(anyBase, 32u);

    const struct {
        std::string value;
        unsigned found;
        float expected;
    } floats[] = {
        {"-2e3", 1, -2000.0f},
        {" 0.25 ", 1, 0.25f},
        {"", 0, 0.0f},
        {"1.5x", 0, 0.0f},
    };
    for (const auto& c : floats) {
        float value = -99.0f;
        EXPECT_EQ(parsed("f=" + c.value)->getFloatProperty(ZELServerString("f"), value), c.found) << c.value;
        EXPECT_FLOAT_EQ(value, c.found ? c.expected : -99.0f) << c.value;
    }
}

// ---- All properties, parsing again

TEST(TransformationResult, NamesAndPairsComeWithoutPrefixInNameOrder)
{
    const auto result = parsed("zeta=1\0*odd=2\0result=3:M|a=b"s);
    ZELServerStringArray names(std::vector<std::string>{"kept"});
    result->getPropertyNames(names);
    EXPECT_EQ(names.items(),
              (std::vector<std::string>{"kept", "odd", "result", "zeta", "StatusMessage", "StatusNumber", "a"}));

    ZELServerStringArray pairs;
    result->getProperties(pairs);
    EXPECT_EQ(pairs.items(), (std::vector<std::string>{"odd", "2", "result", "3:M|a=b", "zeta", "1", "StatusMessage",
                                                       "M", "StatusNumber", "3", "a", "b"}));
}

TEST(TransformationResult, FreshIsEmptyAndParseAgainAddsAndOverwritesButNeverRemoves)
{
    Result result;
    ZELServerString text("before");
    result.getText(text);
    EXPECT_EQ(text.str(), "");
    EXPECT_TRUE(result.properties().empty());
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

}  // namespace
}  // namespace zel
