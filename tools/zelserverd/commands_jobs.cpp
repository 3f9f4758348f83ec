// Jobs and their logs: "JOB_REQUEST", "ABORT_JOB_REQUEST", "GET_JOB_RESULT_STRING" and the
// three "LOG_" commands.
#include <fcntl.h>
#include <sys/stat.h>

#include "commands.h"
#include "jobs.h"
#include "server.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

Reply jobRequest(CommandContext& context, const Target&)
{
    Reply failure;
    JobSubmission submission;
    auto keyword = context.required("keyword", failure);
    if (!keyword)
        return failure;
    auto request = context.required("request", failure);
    if (!request)
        return failure;
    submission.keyword = *keyword;
    submission.request = *request;
    submission.user = context.principal().user;
    if (const std::string* delay = context.request.find("secondsFromNow")) {
        auto seconds = parseDecimal(*delay, UINT32_MAX);
        if (!seconds)
            return Reply::error("bad secondsFromNow '" + *delay + "'");
        submission.delaySeconds = static_cast<std::uint32_t>(*seconds);
    }
    // The result-port exchange puts the port it actually bound first; a caller's own
    // "requesterResultPort" directive may follow and is not the one to use.
    const std::string* port = context.request.find("requesterResultPort");
    const std::string* host = context.request.find("requesterHost");
    if ((port != nullptr) != (host != nullptr))
        return Reply::error("requesterResultPort and requesterHost go together");
    if (port) {
        auto number = parseDecimal(*port, 65535);
        if (!number || *number == 0 || host->empty())
            return Reply::error("bad result address '" + *host + ":" + *port + "'");
        submission.requesterHost = *host;
        submission.requesterPort = static_cast<std::uint16_t>(*number);
    }
    submission.notifications = context.request.all("notificationMsg");
    std::string error;
    std::int64_t id = context.server.jobs->submit(submission, error);
    if (id == 0)
        return Reply::error(error);
    return Reply::ok(std::to_string(id));
}

Reply abortJob(CommandContext& context, const Target& t)
{
    std::int64_t id = t.job;
    std::string error = context.server.jobs->abort(id, context.principal().user);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply jobResult(CommandContext& context, const Target& t)
{
    std::int64_t id = t.job;
    std::optional<std::string> text = context.server.jobs->resultText(id);
    return Reply::ok(text ? *text : "null");
}

Reply logExists(CommandContext& context, const Target& t)
{
    std::int64_t id = t.job;
    struct stat info {};
    return Reply::boolean(::stat(context.server.jobs->logPath(id).c_str(), &info) == 0);
}

Reply logInfo(CommandContext& context, const Target& t)
{
    std::int64_t id = t.job;
    struct stat info {};
    if (::stat(context.server.jobs->logPath(id).c_str(), &info) != 0)
        return Reply::error("job " + std::to_string(id) + " has no log");
    return Reply::ok(replyDocument("LOG_GET_FILEINFO", [&](pugi::xml_node root) {
        root.append_child("LOGFILEINFO").append_attribute("size") =
            std::to_string(static_cast<unsigned long long>(info.st_size)).c_str();
    }));
}

Reply logFile(CommandContext& context, const Target& t)
{
    std::int64_t id = t.job;
    // The log of a running job keeps growing; the transfer sends what is there when it starts.
    UniqueFd fd(::open(context.server.jobs->logPath(id).c_str(), O_RDONLY | O_CLOEXEC));
    if (!fd.valid())
        return Reply::error("job " + std::to_string(id) + " has no log");
    return sendCommandDownload(context, fd.get(), "");
}

}  // namespace

std::vector<CommandSpec> jobCommands()
{
    constexpr Needs job{.job = true};
    return {
        {"JOB_REQUEST", kRightJobs, {}, jobRequest},           {"ABORT_JOB_REQUEST", kRightJobs, job, abortJob},
        {"GET_JOB_RESULT_STRING", kRightJobs, job, jobResult}, {"LOG_FILEEXISTS", kRightJobs, job, logExists},
        {"LOG_GET_FILEINFO", kRightJobs, job, logInfo},        {"LOG_GET_FILE", kRightJobs, job, logFile},
    };
}

}  // namespace zelserverd
