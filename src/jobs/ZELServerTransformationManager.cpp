#include "jobs/ZELServerTransformationManager.h"

#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

#include <zelserverapi/ZELServerStringDict.h>

#include "api/exception_guard.h"
#include "api/StringDict.h"
#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/conversions.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/checked_command.h"

namespace zel {
namespace {

constexpr const char* kJobRequest = "JOB_REQUEST";

// The two texts every job-running operation sends, trimmed of spaces.
struct JobInput {
    std::string keyword;
    std::string request;
};

// Only the space character: tabs and line ends are part of what the server is given.
std::string trimSpaces(const std::string& text)
{
    const std::size_t first = text.find_first_not_of(' ');
    if (first == std::string::npos) {
        return std::string();
    }
    return text.substr(first, text.find_last_not_of(' ') - first + 1);
}

bool unusable(const std::string& trimmed) { return trimmed.empty() || trimmed.find('\0') != std::string::npos; }

// Keyword and request text, trimmed, with the checks they must pass before anything is sent.
// `keywordParameter` is the name the failure reports for the keyword: the submit path reports it as
// "subsectionName", the transact path as "keyword".
struct CheckedJobInput : JobInput {
    Check keywordCheck;
    Check requestCheck;
};

CheckedJobInput checkJobInput(const IZELServerString& keyword, const IZELServerString& requestText,
                              const char* keywordParameter)
{
    const std::string keywordGiven = toStdString(keyword);
    const std::string requestGiven = toStdString(requestText);
    CheckedJobInput input;
    input.keyword = trimSpaces(keywordGiven);
    input.request = trimSpaces(requestGiven);
    input.keywordCheck = {!unusable(input.keyword), msg::kInvalidArgument, {keywordParameter, keywordGiven}};
    input.requestCheck = {!unusable(input.request), msg::kInvalidArgument, {"request", requestGiven}};
    return input;
}

// The server reads job IDs as signed 32-bit numbers, so the top half of the range goes out negative.
std::string jobIdText(unsigned jobId) { return decimalText(static_cast<std::int32_t>(jobId)); }

// What a job request object hands the manager; read afresh for every operation.
struct RequestParts {
    ZELServerString keyword;
    ZELServerString text;
    ZELServerStringArray directives;
    ZELServerStringArray notifications;

    explicit RequestParts(const IZELServerTransformationRequest& request)
    {
        request.getKeyword(keyword);
        request.getRequestText(text);
        request.getDirectives(directives);
        request.getNotifications(notifications);
    }
};

}  // namespace

// ---- Base: transact -------------------------------------------------------------------------------

ZELServerBaseTransformationManager::~ZELServerBaseTransformationManager() { channel_ = nullptr; }

IZELServerStatus* ZELServerBaseTransformationManager::transactJob(const IZELServerTransformationRequest& request,
                                                                  IZELServerTransformationResult& result)
{
    return guarded([&] {
        const RequestParts parts(request);
        ZELServerString resultText;
        IZELServerStatus* status =
            transact(parts.keyword, parts.text, parts.directives, parts.notifications, resultText);
        if (status == nullptr) {
            result.parse(resultText);
        }
        return status;
    });
}

IZELServerStatus* ZELServerBaseTransformationManager::transactJobString(const IZELServerString& keyword,
                                                                        const IZELServerString& requestText,
                                                                        const IZELServerStringArray& directives,
                                                                        IZELServerString& resultText)
{
    return guarded([&] { return transact(keyword, requestText, directives, ZELServerStringArray(), resultText); });
}

IZELServerStatus* ZELServerBaseTransformationManager::transact(const IZELServerString& keyword,
                                                               const IZELServerString& requestText,
                                                               const IZELServerStringArray& directives,
                                                               const IZELServerStringArray& notifications,
                                                               IZELServerString& resultText)
{
    const CheckedJobInput input = checkJobInput(keyword, requestText, "keyword");
    // The lists are only handed over: the result-port exchange writes them itself, behind the
    // result port and host it adds.
    return CheckedCommand(channel_, kJobRequest)
        .check(input.keywordCheck)
        .check(input.requestCheck)
        .add("keyword", input.keyword)
        .add("request", input.request)
        .appendDirectives(directives)
        .appendNotifications(notifications)
        .run([&resultText](Command& command) {
            IZELServerStatus* status = command.send(kResultPortRequest);
            // Also after a failure: whatever the server answered is the caller's only clue.
            copyText(command.body(), resultText);
            return status;
        });
}

// ---- Manager: forwarding --------------------------------------------------------------------------

IZELServerStatus* ZELServerTransformationManager::transactJob(const IZELServerTransformationRequest& request,
                                                              IZELServerTransformationResult& result)
{
    return ZELServerBaseTransformationManager::transactJob(request, result);
}

IZELServerStatus* ZELServerTransformationManager::transactJobString(const IZELServerString& keyword,
                                                                    const IZELServerString& requestText,
                                                                    const IZELServerStringArray& directives,
                                                                    IZELServerString& resultText)
{
    return ZELServerBaseTransformationManager::transactJobString(keyword, requestText, directives, resultText);
}

// ---- Submission and scheduling --------------------------------------------------------------------

IZELServerStatus* ZELServerTransformationManager::submitJob(const IZELServerTransformationRequest& request,
                                                            unsigned& jobId)
{
    return guarded([&] {
        const RequestParts parts(request);
        return submit(parts.keyword, parts.text, parts.directives, &parts.notifications, jobId);
    });
}

IZELServerStatus* ZELServerTransformationManager::submitJobString(const IZELServerString& keyword,
                                                                  const IZELServerString& requestText,
                                                                  const IZELServerStringArray& directives,
                                                                  unsigned& jobId)
{
    return guarded([&] { return submit(keyword, requestText, directives, nullptr, jobId); });
}

IZELServerStatus* ZELServerTransformationManager::submit(const IZELServerString& keyword,
                                                         const IZELServerString& requestText,
                                                         const IZELServerStringArray& directives,
                                                         const IZELServerStringArray* notifications, unsigned& jobId)
{
    const CheckedJobInput input = checkJobInput(keyword, requestText, "subsectionName");
    // Unlike the transact path, the keyword goes out as the caller gave it; only the check trims it.
    CheckedCommand command(channel(), kJobRequest);
    command.check(input.keywordCheck)
        .check(input.requestCheck)
        .add("keyword", keyword)
        .add("request", input.request)
        .addList("directives", directives);
    if (notifications != nullptr) {
        forEachPair(*notifications, [&command](const std::string& topic, const std::string& message) {
            command.add("notificationMsg", topic + ":" + message);
        });
    }
    return command.run([&jobId](Command& exchange) -> IZELServerStatus* {
        if (IZELServerStatus* status = exchange.send(kPlainRequestAlias)) {
            return status;
        }
        // A reply without a number leaves the caller's value; a number followed by other text is taken.
        std::uint32_t id = jobId;
        storeUInt32(exchange.body(), id);
        jobId = id;
        return nullptr;
    });
}

IZELServerStatus* ZELServerTransformationManager::scheduleJob(const IZELServerTransformationRequest& request,
                                                              unsigned secondsFromNow, unsigned& jobId)
{
    return guarded([&] {
        ZELServerString keyword;
        ZELServerString text;
        ZELServerStringArray directives;
        request.getKeyword(keyword);
        request.getRequestText(text);
        request.getDirectives(directives);
        return scheduleJobString(keyword, text, secondsFromNow, directives, jobId);
    });
}

IZELServerStatus* ZELServerTransformationManager::scheduleJobString(const IZELServerString& keyword,
                                                                    const IZELServerString& requestText,
                                                                    unsigned secondsFromNow,
                                                                    const IZELServerStringArray& directives,
                                                                    unsigned& jobId)
{
    return guarded([&] {
        ZELServerStringDict merged = toStringDict(directives);
        merged.insert("secondsFromNow", decimalText(secondsFromNow));
        ZELServerStringArray scheduled;
        appendPairs(merged, scheduled);
        return submitJobString(keyword, requestText, scheduled, jobId);
    });
}

// ---- Abort and results ----------------------------------------------------------------------------

IZELServerStatus* ZELServerTransformationManager::abortJob(unsigned jobId)
{
    return guarded(
        [&] { return CheckedCommand(channel(), "ABORT_JOB_REQUEST").add("jobID", jobIdText(jobId)).send(); });
}

// `found` is left as the caller had it when the command fails: a caller that polls for a result
// keeps its own answer until the server gives one.
IZELServerStatus* ZELServerTransformationManager::getJobResultString(unsigned jobId, unsigned& found,
                                                                     IZELServerString& resultText)
{
    return guarded([&]() -> IZELServerStatus* {
        return CheckedCommand(channel(), "GET_JOB_RESULT_STRING")
            .add("jobID", jobIdText(jobId))
            .run(
                found,
                [&](Command& command) -> IZELServerStatus* {
                    if (IZELServerStatus* status = command.send()) {
                        return status;
                    }
                    // The server answers "null" for a job it has no result for; any other text, also an
                    // empty one, is the result.
                    const std::string body = command.body();
                    found = body == "null" ? 0 : 1;
                    if (found == 1) {
                        copyText(body, resultText);
                    }
                    return nullptr;
                },
                OnFailure::kKeep);
    });
}

IZELServerStatus* ZELServerTransformationManager::getJobResult(unsigned jobId, unsigned& found,
                                                               IZELServerTransformationResult& result)
{
    return guarded([&] {
        ZELServerString text;
        IZELServerStatus* status = getJobResultString(jobId, found, text);
        if (status == nullptr) {
            result.parse(text);
        }
        return status;
    });
}

// ---- Log files ------------------------------------------------------------------------------------

IZELServerStatus* ZELServerTransformationManager::logFileExists(unsigned jobId, unsigned& exists)
{
    return guarded(
        [&] { return CheckedCommand(channel(), "LOG_FILEEXISTS").add("jobID", jobIdText(jobId)).askFlag(exists); });
}

// A reply the reader cannot use is no failure of the operation: `found` stays 0.
IZELServerStatus* ZELServerTransformationManager::getLogFileInfo(unsigned jobId, IZELServerLogFileInfo& info,
                                                                 unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return CheckedCommand(channel(), "LOG_GET_FILEINFO")
            .add("jobID", jobIdText(jobId))
            .askObject(found, [&info](const IZELServerResponse& response) { return response.readLogFileInfo(info); });
    });
}

IZELServerStatus* ZELServerTransformationManager::getLogFile(unsigned jobId, const IZELServerString& localPath,
                                                             unsigned& success)
{
    return guarded([&] {
        const std::string job = jobIdText(jobId);
        // The client never asks the server to check the log's checksum.
        return CheckedCommand(channel(), "LOG_GET_FILE")
            .add("jobID", job)
            .add("logFileCRCCheckingEnabled", "false")
            .download({toStdString(localPath), "job " + job}, success, nullptr);
    });
}

}  // namespace zel
