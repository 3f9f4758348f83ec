// The transformation manager on the wire: every command byte for byte, what each operation leaves in
// its out values after an answer, a refusal or a failure, and the input checks that run before
// anything is sent.

#include "jobs/ZELServerTransformationManager.h"

#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "jobs/ZELServerLogFileInfo.h"
#include "jobs/ZELServerTransformationRequest.h"
#include "jobs/ZELServerTransformationResult.h"
#include "support/environment.h"
#include "support/wire_table.h"

using namespace std::string_literals;
using namespace zeltest;

namespace zel {
namespace {

ZELServerString str(const std::string& text) { return ZELServerString(text); }
ZELServerStringArray list(std::vector<std::string> items) { return ZELServerStringArray(std::move(items)); }

std::string emptyRequestText(const std::string& path)
{
    return path + R"( -XML_PARAMETER <?xml version="1.0" encoding="UTF-8" standalone="no" ?><TRANSFORMATION_REQUEST/>)";
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
    const TempDir scratch{"zel-jobs"};
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
                                 {"request", emptyRequestText("R/w/w.zlw")},
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
         transaction({{"keyword", "svc"}, {"request", emptyRequestText("R/w/w.zlw")}},
                     {{"priority", "5"}, {"notificationMsg", "A:x"}, {"notificationMsg", "B:y"}},
                     reply("SUCCESS", "accepted"), "jobStatus=SUCCESS\0id=3"s)},
        {"refused transaction leaves the result alone", none, none,
         [&] { return outcome(manager.transactJob(job, result), [&] { return resultText(); }); }, msg::kServerError,
         "jobStatus=SUCCESS\0id=3 "s,
         transaction({{"keyword", "svc"}, {"request", emptyRequestText("R/w/w.zlw")}},
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
        {"   ", "r", invalid("subsectionName", "   "), invalid("keyword", "   ")},
        {" k ", "  ", invalid("request", "  "), invalid("request", "  ")},
        {"k", "x\0y"s, invalid("request", "x"), invalid("request", "x")},
        {" ", " ", invalid("subsectionName", " "), invalid("keyword", " ")},
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

}  // namespace
}  // namespace zel
