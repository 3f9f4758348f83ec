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

constexpr unsigned kUntouched = 0xDEADBEEFu;

std::unique_ptr<ZELServerTransformationResult> parsed(const std::string& text)
{
    auto result = std::make_unique<ZELServerTransformationResult>();
    result->parse(ZELServerString(text));
    return result;
}

// ---- Unsigned getters -------------------------------------------------------------------------------

struct UIntCase {
    const char* what;
    std::string text;
    unsigned found;
    unsigned value;  // kUntouched when the out value must stay as it was
};

class ResultIdGetter : public ::testing::TestWithParam<UIntCase> {};

TEST_P(ResultIdGetter, ConvertsLikeTheServerWritesNumbers)
{
    const auto result = parsed(GetParam().text);
    unsigned id = kUntouched;
    EXPECT_EQ(result->getID(id), GetParam().found);
    EXPECT_EQ(id, GetParam().value);
}

const UIntCase kIdCases[] = {
    {"decimal", "id=17", 1, 17},
    {"leading blanks", "id=   17", 1, 17},
    {"hexadecimal", "id=0x1F", 1, 31},
    {"upper-case hex marker", "id=0XfF", 1, 255},
    {"zero fraction and trailing blanks", "id=12.000  ", 1, 12},
    {"largest", "id=4294967295", 1, 4294967295u},
    {"minus wraps like the server's reader", "id=-1", 1, 4294967295u},
    {"other text behind the number: stored, not found", "id=12abc", 0, 12},
    {"real fraction: stored, not found", "id=12.5", 0, 12},
    {"overflow", "id=4294967296", 0, kUntouched},
    {"no number", "id=abc", 0, kUntouched},
    {"empty", "id=", 0, kUntouched},
    {"blanks only", "id=   ", 0, kUntouched},
    {"missing", "other=1", 0, kUntouched},
    {"a result piece is not the job's id", "result=id=5", 0, kUntouched},
};

INSTANTIATE_TEST_SUITE_P(Table, ResultIdGetter, ::testing::ValuesIn(kIdCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

class ResultPortGetter : public ::testing::TestWithParam<UIntCase> {};

TEST_P(ResultPortGetter, RefusesAMinusSign)
{
    const auto result = parsed(GetParam().text);
    unsigned port = kUntouched;
    EXPECT_EQ(result->getRequesterResultPort(port), GetParam().found);
    EXPECT_EQ(port, GetParam().value);
}

const UIntCase kPortCases[] = {
    {"decimal", "requesterResultPort=7071", 1, 7071},
    {"hexadecimal", "requesterResultPort=0x10", 1, 16},
    {"minus", "requesterResultPort=-1", 0, kUntouched},
    {"blank then minus", "requesterResultPort= -5", 0, kUntouched},
    {"trailing text: stored, not found", "requesterResultPort=80x", 0, 80},
    {"missing", "", 0, kUntouched},
};

INSTANTIATE_TEST_SUITE_P(Table, ResultPortGetter, ::testing::ValuesIn(kPortCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST(TransformationResult, PriorityAndStatusNumberUseTheirOwnNames)
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

// ---- Job status -------------------------------------------------------------------------------------

TEST(TransformationResult, SuccessTextGivesCodeSevenAndId)
{
    const auto result = parsed("jobStatus=SUCCESS\0id=17"s);
    unsigned code = kUntouched;
    unsigned id = 0;
    EXPECT_EQ(result->getJobStatus(code), 1u);
    EXPECT_EQ(code, 7u);
    EXPECT_EQ(result->isSuccess(), 1u);
    EXPECT_EQ(result->getID(id), 1u);
    EXPECT_EQ(id, 17u);
}

struct JobStatusCase {
    std::string text;
    unsigned found;
    unsigned code;
    unsigned success;
};

class ResultJobStatus : public ::testing::TestWithParam<JobStatusCase> {};

TEST_P(ResultJobStatus, ComparesTheWholeWordExactly)
{
    const auto result = parsed(GetParam().text);
    unsigned code = kUntouched;
    EXPECT_EQ(result->getJobStatus(code), GetParam().found);
    EXPECT_EQ(code, GetParam().code);
    EXPECT_EQ(result->isSuccess(), GetParam().success);
}

const JobStatusCase kJobStatusCases[] = {
    {"jobStatus=QUEUED", 1, 1, 0},
    {"jobStatus=PULLED", 1, 10, 0},
    {"jobStatus=JOB_FAILURE", 1, 9, 0},
    {"jobStatus=success", 0, kUntouched, 0},
    {"jobStatus=SUCCESS ", 0, kUntouched, 0},
    {"jobStatus=", 0, kUntouched, 0},
    {"id=1", 0, kUntouched, 0},
};

INSTANTIATE_TEST_SUITE_P(Table, ResultJobStatus, ::testing::ValuesIn(kJobStatusCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

// ---- Booleans ---------------------------------------------------------------------------------------

struct BoolCase {
    std::string value;
    unsigned found;
    unsigned flag;
};

class ResultBoolean : public ::testing::TestWithParam<BoolCase> {};

TEST_P(ResultBoolean, ReadsFirstLetterOrNumber)
{
    const auto result = parsed("resultSuccess=" + GetParam().value + "\0serviceSuccess="s + GetParam().value);
    unsigned flag = kUntouched;
    EXPECT_EQ(result->getBoolProperty(std::string("resultSuccess"), flag), GetParam().found);
    EXPECT_EQ(flag, GetParam().found ? GetParam().flag : kUntouched);
    // The two success getters answer the value itself, and 0 for what does not convert.
    EXPECT_EQ(result->getResultSuccess(), GetParam().flag);
    EXPECT_EQ(result->getServiceSuccess(), GetParam().flag);
}

const BoolCase kBoolCases[] = {
    {"true", 1, 1}, {"Yes", 1, 1},  {"y", 1, 1},   {"T", 1, 1},   {"false", 1, 0}, {"No", 1, 0},
    {"f", 1, 0},    {"n", 1, 0},    {"1", 1, 1},   {"0", 1, 0},   {"2.5", 1, 1},   {"0.0", 1, 0},
    {"-3", 1, 1},   {"abc", 0, 0},  {"", 0, 0},    {"xyes", 0, 0},
};

INSTANTIATE_TEST_SUITE_P(Table, ResultBoolean, ::testing::ValuesIn(kBoolCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST(TransformationResult, MissingSuccessFlagsReadAsZero)
{
    const auto result = parsed("id=1");
    EXPECT_EQ(result->getResultSuccess(), 0u);
    EXPECT_EQ(result->getServiceSuccess(), 0u);
}

// ---- Texts ------------------------------------------------------------------------------------------

TEST(TransformationResult, TextGettersReadTheirProperty)
{
    const auto result = parsed(
        "result=0:ok\0serviceMsg=done\0timeRequested=20240102\0timeStarted=20240103\0timeFinished=20240104\0"
        "requesterHost=10.0.0.1\0request=R/w/w.ext -XML_PARAMETER x\0requestKeyword=svc\0description=nightly"s);
    struct Getter {
        const char* what;
        unsigned (ZELServerTransformationResult::*get)(IZELServerString&) const;
        const char* expected;
    };
    const Getter getters[] = {
        {"result", &ZELServerTransformationResult::getResult, "0:ok"},
        {"serviceMsg", &ZELServerTransformationResult::getServiceMessage, "done"},
        {"timeRequested", &ZELServerTransformationResult::getTimeRequested, "20240102"},
        {"timeStarted", &ZELServerTransformationResult::getTimeStarted, "20240103"},
        {"timeFinished", &ZELServerTransformationResult::getTimeFinished, "20240104"},
        {"requesterHost", &ZELServerTransformationResult::getRequesterHost, "10.0.0.1"},
        {"request", &ZELServerTransformationResult::getRequest, "R/w/w.ext -XML_PARAMETER x"},
        {"requestKeyword", &ZELServerTransformationResult::getRequestKeyword, "svc"},
        {"description", &ZELServerTransformationResult::getDescription, "nightly"},
    };
    const auto empty = parsed("");
    for (const Getter& getter : getters) {
        ZELServerString out;
        EXPECT_EQ(((*result).*getter.get)(out), 1u) << getter.what;
        EXPECT_EQ(out.str(), getter.expected) << getter.what;
        ZELServerString untouched("before");
        EXPECT_EQ(((*empty).*getter.get)(untouched), 0u) << getter.what;
        EXPECT_EQ(untouched.str(), "before") << getter.what;
    }
}

TEST(TransformationResult, DescriptionNullIsNotFoundButWritten)
{
    const auto result = parsed("description=null");
    ZELServerString out("before");
    EXPECT_EQ(result->getDescription(out), 0u);
    EXPECT_EQ(out.str(), "null");
}

TEST(TransformationResult, ValuesKeepEmbeddedEqualsAndTheirLength)
{
    const auto result = parsed("serviceMsg=a=b\0other=x"s);
    ZELServerString out;
    EXPECT_EQ(result->getServiceMessage(out), 1u);
    EXPECT_EQ(out.str(), "a=b");
}

// ---- Generic lookup ---------------------------------------------------------------------------------

TEST(TransformationResult, NamesAreFoundWithAndWithoutPrefix)
{
    const auto result = parsed("x=1\0result=12:Done|a=b"s);
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
}

TEST(TransformationResult, UnprefixedPieceShadowsTextEntryForGenericNames)
{
    // A "result" piece is stored without the prefix and is looked up first; the typed getter for the
    // text's own entry still reads the prefixed one.
    const auto result = parsed("priority=1\0result=priority=9"s);
    unsigned generic = 0;
    unsigned typed = 0;
    EXPECT_EQ(result->getUIntProperty(ZELServerString("priority"), generic), 1u);
    EXPECT_EQ(generic, 9u);
    EXPECT_EQ(result->getPriority(typed), 1u);
    EXPECT_EQ(typed, 1u);
}

struct FloatCase {
    std::string value;
    unsigned found;
    float expected;
};

class ResultFloat : public ::testing::TestWithParam<FloatCase> {};

TEST_P(ResultFloat, ReadsDecimalFloatingPoint)
{
    const auto result = parsed("f=" + GetParam().value);
    float value = -99.0f;
    EXPECT_EQ(result->getFloatProperty(ZELServerString("f"), value), GetParam().found);
    EXPECT_FLOAT_EQ(value, GetParam().found ? GetParam().expected : -99.0f);
}

const FloatCase kFloatCases[] = {
    {"1.5", 1, 1.5f}, {"-2e3", 1, -2000.0f}, {" 0.25 ", 1, 0.25f}, {"7", 1, 7.0f},
    {"abc", 0, 0.0f}, {"", 0, 0.0f},         {"1.5x", 0, 0.0f},
};

INSTANTIATE_TEST_SUITE_P(Table, ResultFloat, ::testing::ValuesIn(kFloatCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST(TransformationResult, UIntAndBoolByInterfaceName)
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
}

// ---- All properties ---------------------------------------------------------------------------------

TEST(TransformationResult, NamesAndPairsComeWithoutPrefixInNameOrder)
{
    const auto result = parsed("zeta=1\0*odd=2\0result=3:M|a=b"s);
    ZELServerStringArray names(std::vector<std::string>{"kept"});
    result->getPropertyNames(names);
    EXPECT_EQ(names.items(), (std::vector<std::string>{"kept", "odd", "result", "zeta", "StatusMessage",
                                                       "StatusNumber", "a"}));

    ZELServerStringArray pairs;
    result->getProperties(pairs);
    EXPECT_EQ(pairs.items(), (std::vector<std::string>{"odd", "2", "result", "3:M|a=b", "zeta", "1", "StatusMessage",
                                                       "M", "StatusNumber", "3", "a", "b"}));
}

// ---- Parsing and text -------------------------------------------------------------------------------

TEST(TransformationResult, ParseAgainAddsAndOverwritesButNeverRemoves)
{
    ZELServerTransformationResult result;
    result.parse(ZELServerString("a=1\0b=2"s));
    result.parse(ZELServerString("b=3\0c=4"s));
    ZELServerString text;
    result.getText(text);
    EXPECT_EQ(text.str(), "b=3\0c=4"s);
    EXPECT_EQ(result.properties(), (ResultProperties{{"*a", "1"}, {"*b", "3"}, {"*c", "4"}}));

    result.parse(ZELServerString(""));
    result.getText(text);
    EXPECT_EQ(text.str(), "");
    EXPECT_EQ(result.properties().size(), 3u);
}

TEST(TransformationResult, FreshResultIsEmpty)
{
    ZELServerTransformationResult result;
    ZELServerString text("before");
    result.getText(text);
    EXPECT_EQ(text.str(), "");
    ZELServerStringArray names;
    result.getPropertyNames(names);
    EXPECT_EQ(names.entries(), 0u);
    EXPECT_EQ(result.isSuccess(), 0u);
}

// ---- Factories --------------------------------------------------------------------------------------

TEST(TransformationResultFactory, TextFormIsParsed)
{
    std::unique_ptr<IZELServerTransformationResult> result(makeTransformationResult(ZELServerString("id=5")));
    ASSERT_NE(result, nullptr);
    unsigned id = 0;
    EXPECT_EQ(result->getID(id), 1u);
    EXPECT_EQ(id, 5u);
    std::unique_ptr<IZELServerTransformationResult> empty(makeTransformationResult());
    ASSERT_NE(empty, nullptr);
    EXPECT_EQ(empty->getID(id), 0u);
}

TEST(TransformationResultFactory, ExhaustedHeapGivesNull)
{
    heap::failNextAllocations(1);
    EXPECT_EQ(makeTransformationResult(ZELServerString("id=5")), nullptr);
    heap::failNextAllocations(1);
    EXPECT_EQ(makeTransformationResult(), nullptr);
    heap::failNextAllocations(1);
    EXPECT_EQ(makeLogFileInfo(), nullptr);
}

}  // namespace
}  // namespace zel
