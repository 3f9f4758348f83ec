// Jobs. The transformation manager on the wire: every command byte for byte, what each operation
// leaves in its out values after an answer, a refusal or a failure, and the input checks that run
// before anything is sent. The job request: workspace paths, the four pair dictionaries, the dirty
// flag and the exact request text the server receives. The job result: what each getter finds in a
// result text, and what it leaves in its out value when it finds nothing.

#include "jobs/ZELServerTransformationManager.h"

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "api/message_numbers.h"
#include "jobs/ZELServerLogFileInfo.h"
#include "jobs/ZELServerTransformationRequest.h"
#include "jobs/ZELServerTransformationResult.h"
#include "jobs/jobs_factories.h"
#include "jobs/result_text.h"
#include "repository/ZELServerWorkspace.h"
#include "repository/reply_readers.h"
#include "support/environment.h"
#include "support/wire_table.h"

using namespace std::string_literals;
using namespace zeltest;

namespace zel {
namespace {

ZELServerString str(const std::string& text) { return ZELServerString(text); }
ZELServerStringArray list(std::vector<std::string> items) { return ZELServerStringArray(std::move(items)); }

// The request text the server receives for a workspace path and the document's elements.
std::string textFor(const std::string& path, const std::string& elements)
{
    const std::string document = elements.empty() ? "<TRANSFORMATION_REQUEST/>"
                                                  : "<TRANSFORMATION_REQUEST>" + elements + "</TRANSFORMATION_REQUEST>";
    return path + " -XML_PARAMETER " + R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)" + document;
}

class TransformationManagerWire : public WireTableTest {
protected:
    // The server's side of a transaction: a "JOB_REQUEST" whose values are `before`, the result port
    // and address this side chooses, then `after`; then `answer`, and on success the result on the
    // result port.
    static std::function<void(FakeServer&)> transaction(Values before, Values after, Bytes answer, Bytes result = {})
    {
        return [=](FakeServer& server) {
            server.expectFrameWhere("transact JOB_REQUEST", [=](const Bytes& payload) {
                const std::optional<ParsedRequest> parsed = parseRequest(payload);
                if (!parsed || parsed->values.size() < 2 + before.size() + 2) {
                    return false;
                }
                const std::string port = parsed->values[2 + before.size()].second;
                Values expected = before;
                expected.emplace_back("requesterResultPort", port);
                expected.emplace_back("requesterHost", parsed->values[3 + before.size()].second);
                expected.insert(expected.end(), after.begin(), after.end());
                return port.find_first_not_of("0123456789") == std::string::npos && port != "0" &&
                       payload == command("JOB_REQUEST", expected);
            });
            server.sendFrame(answer);
            if (!result.empty()) {
                server.connectBackAndSend(result);
            }
        };
    }

    std::string resultText() const
    {
        ZELServerString text;
        result.getText(text);
        return text.str();
    }

    ZELServerTransformationManager manager{channel.get()};
    ZELServerString text{"before"};
    ZELServerTransformationResult result;
    ZELServerLogFileInfo info;
    const std::string log = (scratch.path() / "job.log").string();
};

TEST_F(TransformationManagerWire, EveryCommandOnTheWire)
{
    ZELServerTransformationRequest job(str("svc"), str("R/w/w.zlw"));
    job.setDirective(str("priority"), str("5"));
    job.setNotification(str("B"), str("y"));
    job.setNotification(str("A"), str("x"));
    const Bytes submitted = command("JOB_REQUEST", {{"keyword", "k"}, {"request", "r"}});
    const Bytes logContent = "line one\n\0binary\n"s;
    const auto submit = [&] { return outcome(manager.submitJobString(str("k"), str("r"), list({}), fresh()), flag); };
    const auto jobResult = [&](unsigned id) {
        text.assign("before");
        return outcome(manager.getJobResultString(id, fresh(), text), flag, text);
    };
    run({
        {"submit sends the keyword as given and the request trimmed, whole directive pairs only",
         command("JOB_REQUEST", {{"keyword", " svc "}, {"request", "a b"}, {"d", "1"}, {"e", "2"}}),
         reply("SUCCESS", " 42"),
         [&] {
             return outcome(
                 manager.submitJobString(str(" svc "), str("  a b  "), list({"d", "1", "e", "2", "odd"}), fresh()),
                 flag);
         },
         0, "42 "},
        {"submit sends directives, then one notification per pair in name order",
         command("JOB_REQUEST", {{"keyword", "svc"},
                                 {"request", textFor("R/w/w.zlw", "")},
                                 {"priority", "5"},
                                 {"notificationMsg", "A:x"},
                                 {"notificationMsg", "B:y"}}),
         reply("SUCCESS", "17"), [&] { return outcome(manager.submitJob(job, fresh()), flag); }, 0, "17 "},
        {"a number with text behind it is taken", submitted, reply("SUCCESS", "12abc"), submit, 0, "12 "},
        {"refusal keeps the id", submitted, reply("ERROR", "no such service"), submit, msg::kServerError, "7 "},
        {"schedule overrides the caller's secondsFromNow and keeps the names in order",
         command("JOB_REQUEST",
                 {{"keyword", " k"}, {"request", "r"}, {"a", "1"}, {"secondsFromNow", "60"}, {"z", "2"}}),
         reply("SUCCESS", "8"),
         [&] {
             return outcome(manager.scheduleJobString(str(" k"), str("r"), 60,
                                                      list({"z", "2", "secondsFromNow", "5", "a", "1"}), fresh()),
                            flag);
         },
         0, "8 "},
        {"transact trims the keyword and takes the result from the result port", none, none,
         [&] {
             return outcome(manager.transactJobString(str(" svc "), str("  a b  "), list({"d", "1"}), text), text);
         },
         0, "jobStatus=SUCCESS\0id=17 "s,
         transaction({{"keyword", "svc"}, {"request", "a b"}}, {{"d", "1"}}, reply("SUCCESS", "accepted"),
                     "jobStatus=SUCCESS\0id=17"s)},
        {"transact of a request parses the result and sends the notifications", none, none,
         [&] {
             return outcome(
                 manager.transactJob(job, result), [&] { return resultText(); },
                 [&] { return std::to_string(result.isSuccess()); });
         },
         0, "jobStatus=SUCCESS\0id=3 1 "s,
         transaction({{"keyword", "svc"}, {"request", textFor("R/w/w.zlw", "")}},
                     {{"priority", "5"}, {"notificationMsg", "A:x"}, {"notificationMsg", "B:y"}},
                     reply("SUCCESS", "accepted"), "jobStatus=SUCCESS\0id=3"s)},
        {"refused transaction leaves the result alone", none, none,
         [&] { return outcome(manager.transactJob(job, result), [&] { return resultText(); }); }, msg::kServerError,
         "jobStatus=SUCCESS\0id=3 "s,
         transaction({{"keyword", "svc"}, {"request", textFor("R/w/w.zlw", "")}},
                     {{"priority", "5"}, {"notificationMsg", "A:x"}, {"notificationMsg", "B:y"}},
                     reply("ERROR", "Authorization Error: no rights"))},
        {"refused transaction hands out the server's text", none, none,
         [&] { return outcome(manager.transactJobString(str("svc"), str("r"), list({}), text), text); },
         msg::kServerError, "busy ", transaction({{"keyword", "svc"}, {"request", "r"}}, {}, reply("ERROR", "busy"))},
        {"abort sends the id as a signed 32-bit number", command("ABORT_JOB_REQUEST", {{"jobID", "-2147483648"}}),
         reply("SUCCESS", "true"), [&] { return outcome(manager.abortJob(2147483648u)); }, 0, ""},
        {"no result yet", command("GET_JOB_RESULT_STRING", {{"jobID", "-1"}}), reply("SUCCESS", "null"),
         [&] { return jobResult(4294967295u); }, 0, "0 before "},
        {"a refused result query keeps found", command("GET_JOB_RESULT_STRING", {{"jobID", "1"}}),
         reply("ERROR", "unknown job"), [&] { return jobResult(1); }, msg::kServerError, "7 before "},
        {"log exists refused", command("LOG_FILEEXISTS", {{"jobID", "2"}}), reply("ERROR", "down"),
         [&] { return outcome(manager.logFileExists(2, fresh()), flag); }, msg::kServerError, "0 "},
        {"log description", command("LOG_GET_FILEINFO", {{"jobID", "4"}}),
         reply("SUCCESS", R"(<LOG_GET_FILEINFO><LOGFILEINFO size="120"/></LOG_GET_FILEINFO>)"),
         [&] {
             return outcome(manager.getLogFileInfo(4, info, fresh()), flag,
                            [&] { return std::to_string(info.getSize()); });
         },
         0, "1 120 "},
        {"no log description", command("LOG_GET_FILEINFO", {{"jobID", "4"}}), reply("SUCCESS", "no log"),
         [&] { return outcome(manager.getLogFileInfo(4, info, fresh()), flag); }, 0, "0 "},
        {"log file", command("LOG_GET_FILE", {{"jobID", "-1"}, {"logFileCRCCheckingEnabled", "false"}}),
         fileHeader(logContent.size(), crc32(logContent)),
         [&] { return outcome(manager.getLogFile(4294967295u, str(log), fresh()), flag, [&] { return slurp(log); }); },
         0, "1 "s + logContent + " ", downloadOf(logContent, reply("SUCCESS", "true"))},
    });
}

// The channel is never opened: a check that let a command through would fail with "not connected".
TEST(TransformationManagerChecks, KeywordAndRequestAreRefusedBeforeAnythingIsSent)
{
    ZELServerTCPIPChannel channel;
    ZELServerTransformationManager manager(&channel);
    const auto invalid = [](const std::string& name, const std::string& value) {
        return "The argument \"" + name + "\" has an invalid value: \"" + value + "\".";
    };
    const struct {
        std::string keyword;
        std::string request;
        std::string submitMessage;  // also schedule
        std::string transactMessage;
    } cases[] = {
        {" k ", "  ", invalid("request", "  "), invalid("request", "  ")},
        {"k", "x\0y"s, invalid("request", "x"), invalid("request", "x")},
        {" ", " ", invalid("subsectionName", " "), invalid("keyword", " ")},  // the keyword is checked first
        // Only spaces are trimmed: a tab is part of the keyword, and the command reaches the channel.
        {"\t", "r\n", "", ""},
    };
    for (const auto& c : cases) {
        unsigned jobId = 99;
        ZELServerString resultText("before");
        ZELServerTransformationRequest job(str(c.keyword), str("p"));
        const ZELServerStringArray none;
        const std::pair<IZELServerStatus*, std::string> statuses[] = {
            {manager.submitJobString(str(c.keyword), str(c.request), none, jobId), c.submitMessage},
            {manager.scheduleJobString(str(c.keyword), str(c.request), 5, none, jobId), c.submitMessage},
            {manager.transactJobString(str(c.keyword), str(c.request), none, resultText), c.transactMessage},
            {manager.submitJob(job, jobId), c.keyword == "k" || c.keyword == " k " ? "" : c.submitMessage},
        };
        for (const auto& [raw, message] : statuses) {
            const StatusPtr status(raw);
            ASSERT_NE(status, nullptr);
            EXPECT_EQ(status->getMessageNumber(), message.empty() ? msg::kNotConnected : msg::kInvalidArgument);
            if (!message.empty()) {
                EXPECT_EQ(status->getMessage(), message);
            }
        }
        EXPECT_EQ(jobId, 99u);
        // A command that reached the channel hands out whatever came back: nothing.
        EXPECT_EQ(resultText.str(), c.transactMessage.empty() ? "" : "before");
    }
    // A request text that cannot be composed is refused too.
    ZELServerTransformationRequest job(str("svc"), str("p"));
    job.setPublishedParameter(str("P"), str("a\0b"s));
    unsigned jobId = 99;
    const StatusPtr status(manager.submitJob(job, jobId));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessage(), invalid("request", ""));
}

// ---- The job request

using Request = ZELServerTransformationRequest;
using Pairs = std::vector<std::string>;

std::string requestText(const IZELServerTransformationRequest& request)
{
    ZELServerString out;
    request.getRequestText(out);
    return out.str();
}

std::string parameter(const std::string& name, const std::string& value)
{
    return "<PUBLISHED_PARAMETER name=\"" + name + "\">" + value + "</PUBLISHED_PARAMETER>";
}

TEST(TransformationRequest, WorkspacePathDropsFourCharactersForTheFolderInEveryForm)
{
    const struct {
        std::string repository;
        std::string workspace;
        std::string path;
    } cases[] = {
        {"Samples", "harbour.zlw", "Samples/harbour/harbour.zlw"},
        {"R", "abc", "R//abc"},  // shorter names lose everything they have, and nothing before them
        {"", "w.zlw", "/w/w.zlw"},
    };
    for (const auto& c : cases) {
        ZELServerWorkspace workspace(nullptr);
        ASSERT_EQ(
            readWorkspaceReply("<R><WORKSPACE_DEFINITIONS name=\"" + c.workspace + "\"/></R>", nullptr, workspace), 0);
        EXPECT_EQ(requestText(Request(str("S"), str(c.repository), str(c.workspace))), textFor(c.path, ""));
        EXPECT_EQ(requestText(Request(str("S"), str(c.repository), workspace)), textFor(c.path, ""));
    }
    // An exhausted heap makes no request.
    heap::failNextAllocations(1);
    EXPECT_EQ(makeTransformationRequest(str("S"), str("R/x/y")), nullptr);
}

TEST(TransformationRequest, TextHoldsParametersInNameOrderEscapedAsUtf8ThenEmbeddedDirectives)
{
    Request request(str("S"), str("p"));
    request.setEmbeddedDirective(str("LOG_LEVEL"), str("2"));
    request.setPublishedParameter(str("ZONE"), str("first"));
    request.setPublishedParameter(str("AREA"), str("a<b & c>d"));
    request.setPublishedParameter(str("ZONE"), str("north"));
    request.setPublishedParameter(str("a\"b"), str("Z\xFCrich"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("AREA", "a&lt;b &amp; c&gt;d") + parameter("ZONE", "north") +
                                                     parameter("a&quot;b", "Z\xC3\xBCrich") +
                                                     R"(<ZEL_DIRECTIVE name="LOG_LEVEL">2</ZEL_DIRECTIVE>)"));
}

TEST(TransformationRequest, TextIsComposedAgainOnlyAfterAChangeThatNeedsIt)
{
    Request request(str("S"), str("p"));
    request.setPublishedParameter(str("P"), str("a\0b"s));
    ZELServerString out("before");
    request.getRequestText(out);
    EXPECT_EQ(out.str(), "before");
    EXPECT_TRUE(request.dirty());
    request.setPublishedParameter(str("P"), str("ab"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("P", "ab")));
    EXPECT_FALSE(request.dirty());
    // Embedded directives wait for the next change that recomposes the text.
    request.setEmbeddedDirective(str("D"), str("1"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("P", "ab")));
    request.setKeyword(str("S"));
    EXPECT_EQ(requestText(request),
              textFor("p", parameter("P", "ab") + R"(<ZEL_DIRECTIVE name="D">1</ZEL_DIRECTIVE>)"));
}

struct Dictionary {
    const char* what;
    void (Request::*setOne)(const IZELServerString&, const IZELServerString&);
    void (Request::*setAll)(const IZELServerStringArray&);
    unsigned (Request::*getOne)(const IZELServerString&, IZELServerString&) const;
    void (Request::*getAll)(IZELServerStringArray&) const;
};

const Dictionary kDictionaries[] = {
    {"published", &Request::setPublishedParameter, &Request::setPublishedParameters, &Request::getPublishedParameter,
     &Request::getPublishedParameters},
    {"directives", &Request::setDirective, &Request::setDirectives, &Request::getDirective, &Request::getDirectives},
    {"embedded", &Request::setEmbeddedDirective, &Request::setEmbeddedDirectives, &Request::getEmbeddedDirective,
     &Request::getEmbeddedDirectives},
    {"notifications", &Request::setNotification, &Request::setNotifications, &Request::getNotification,
     &Request::getNotifications},
};

TEST(TransformationRequest, DictionaryPairsReplaceByNameAndStayApart)
{
    for (const Dictionary& d : kDictionaries) {
        SCOPED_TRACE(d.what);
        Request request(str("S"), str("p"));
        (request.*d.setAll)(ZELServerStringArray(Pairs{"b", "1", "a", "2", "odd"}));
        (request.*d.setOne)(str("a"), str("5"));
        ZELServerStringArray all(Pairs{"kept"});
        (request.*d.getAll)(all);
        EXPECT_EQ(all.items(), (Pairs{"kept", "a", "5", "b", "1"}));
        ZELServerString value("untouched");
        EXPECT_EQ((request.*d.getOne)(str("b"), value), 1u);
        EXPECT_EQ(value.str(), "1");
        value.assign("untouched");
        EXPECT_EQ((request.*d.getOne)(str("odd"), value), 0u);
        EXPECT_EQ(value.str(), "untouched");

        for (const Dictionary& other : kDictionaries) {
            ZELServerStringArray pairs;
            (request.*other.getAll)(pairs);
            EXPECT_EQ(pairs.entries(), other.getAll == d.getAll ? 4u : 0u) << "seen in " << other.what;
        }
    }
}

// ---- The job result

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
