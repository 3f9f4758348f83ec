// job: submit, run, schedule, abort, result, wait and log.

#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <random>
#include <thread>

#include "commands.h"
#include "progress.h"

namespace zelctl {

namespace {

// The words of the job status codes, in code order.
const char* const kStatusWords[] = {"SUBMITTED", "QUEUED",  "DELAYED",     "PAUSED",      "IN_PROCESS", "DELETED",
                                    "ABORTED",   "SUCCESS", "ZEL_FAILURE", "JOB_FAILURE", "PULLED"};

std::string statusWord(unsigned code)
{
    return code < std::size(kStatusWords) ? kStatusWords[code] : std::to_string(code);
}

// A job is still going while its code is one of SUBMITTED through IN_PROCESS.
bool stillGoing(unsigned code) { return code <= 4; }

struct RequestArguments {
    std::string service;
    std::string repository;
    std::string workspace;
    std::vector<std::string> parameters;
    std::vector<std::string> directives;
    std::vector<std::string> notifications;
};

void addRequestOptions(CLI::App* command, RequestArguments& arguments)
{
    command->add_option("SERVICE", arguments.service, "Job service keyword, e.g. zeljob")->required();
    command->add_option("REPOSITORY", arguments.repository, "Repository of the workspace")->required();
    command->add_option("WORKSPACE", arguments.workspace, "Workspace item")->required();
    command->add_option("-p,--parameter", arguments.parameters, "Published parameter NAME=VALUE");
    command->add_option("-d,--directive", arguments.directives, "Directive NAME=VALUE");
    command->add_option("--notify", arguments.notifications, "Notification TOPIC=MESSAGE");
}

// Builds the request from the command line; null with a complaint when an entry is no NAME=VALUE.
Outcome buildRequest(Connection& connection, const RequestArguments& arguments,
                     ZELServerOwned<IZELServerTransformationRequest>& request)
{
    request = connection.own(connection.session().createTransformationRequest(connection.text(arguments.service),
                                                                              connection.text(arguments.repository),
                                                                              connection.text(arguments.workspace)));
    if (!request)
        return complaint("out of memory for the job request");
    using Setter = void (IZELServerTransformationRequest::*)(const IZELServerString&, const IZELServerString&);
    const std::pair<const std::vector<std::string>*, Setter> lists[] = {
        {&arguments.parameters, &IZELServerTransformationRequest::setPublishedParameter},
        {&arguments.directives, &IZELServerTransformationRequest::setDirective},
        {&arguments.notifications, &IZELServerTransformationRequest::setNotification},
    };
    for (const auto& [list, setter] : lists) {
        for (const std::string& entry : *list) {
            const auto pair = splitPair(entry);
            if (!pair)
                return complaint("expected NAME=VALUE, got '" + entry + "'");
            (request.get()->*setter)(connection.text(pair->first), connection.text(pair->second));
        }
    }
    return std::nullopt;
}

using Result = ZELServerOwned<IZELServerTransformationResult>;

Result newResult(Connection& connection) { return connection.own(connection.session().createTransformationResult()); }

nlohmann::ordered_json describe(Connection& connection, const IZELServerTransformationResult& result)
{
    unsigned id = 0;
    unsigned code = 0;
    result.getID(id);
    const bool hasCode = result.getJobStatus(code) != 0;
    auto text = [&](unsigned (IZELServerTransformationResult::*getter)(IZELServerString&) const) {
        return connection.read([&](IZELServerString& out) { (result.*getter)(out); });
    };
    nlohmann::ordered_json json = {{"id", id},
                                   {"status", hasCode ? statusWord(code) : ""},
                                   {"success", result.isSuccess() != 0},
                                   {"message", text(&IZELServerTransformationResult::getStatusMessage)},
                                   {"result", text(&IZELServerTransformationResult::getResult)},
                                   {"requested", text(&IZELServerTransformationResult::getTimeRequested)},
                                   {"started", text(&IZELServerTransformationResult::getTimeStarted)},
                                   {"finished", text(&IZELServerTransformationResult::getTimeFinished)}};
    return json;
}

Outcome submit(Context& context, const RequestArguments& arguments, const unsigned* delay)
{
    ZELServerOwned<IZELServerTransformationRequest> request;
    if (Outcome failure = buildRequest(context.connection, arguments, request))
        return failure;
    IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
    unsigned id = 0;
    IZELServerStatus* status = delay ? jobs->scheduleJob(*request, *delay, id) : jobs->submitJob(*request, id);
    if (Outcome failure = context.connection.check(status))
        return failure;
    if (context.output.json())
        context.output.print({{"id", id}});
    else
        context.output.print(std::to_string(id));
    return std::nullopt;
}

Outcome runJob(Context& context, const RequestArguments& arguments)
{
    ZELServerOwned<IZELServerTransformationRequest> request;
    if (Outcome failure = buildRequest(context.connection, arguments, request))
        return failure;
    const Result result = newResult(context.connection);
    if (!result)
        return complaint("out of memory for the job result");
    IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
    if (Outcome failure = context.connection.check(jobs->transactJob(*request, *result)))
        return failure;
    context.output.print(describe(context.connection, *result));
    return std::nullopt;
}

// Fetches the job's result; a job the server does not know is a failure.
Outcome fetch(Context& context, unsigned id, const Result& result, unsigned& code)
{
    if (!result)
        return complaint("out of memory for the job result");
    unsigned found = 0;
    IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
    if (Outcome failure = context.connection.check(jobs->getJobResult(id, found, *result)))
        return failure;
    if (!found)
        return complaint("no job " + std::to_string(id));
    code = 0;
    result->getJobStatus(code);
    return std::nullopt;
}

Outcome wait(Context& context, unsigned id)
{
    const bool spin = !context.output.quiet() && stderrIsTerminal();
    const char spinner[] = {'|', '/', '-', '\\'};
    const Result result = newResult(context.connection);
    unsigned code = 0;
    for (unsigned turn = 0;; ++turn) {
        if (Outcome failure = fetch(context, id, result, code))
            return failure;
        if (!stillGoing(code))
            break;
        if (spin) {
            std::fprintf(stderr, "\rjob %u %s %c ", id, statusWord(code).c_str(), spinner[turn % 4]);
            std::fflush(stderr);
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
    }
    if (spin)
        std::fputs("\r\033[K", stderr);
    context.output.print(describe(context.connection, *result));
    return std::nullopt;
}

// A file name of our own in the temporary folder, for a log that goes to standard output.
std::filesystem::path scratchFile()
{
    std::random_device random;
    return std::filesystem::temp_directory_path() / ("zelctl-" + std::to_string(random()) + ".log");
}

Outcome log(Context& context, unsigned id, const std::string& file)
{
    const std::filesystem::path target = file.empty() ? scratchFile() : std::filesystem::path(file);
    unsigned success = 0;
    IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
    Outcome failure = context.connection.check(jobs->getLogFile(id, context.connection.text(target.string()), success));
    if (!failure && !success)
        failure = complaint("no log for job " + std::to_string(id));
    if (file.empty()) {
        if (!failure) {
            std::ifstream in(target, std::ios::binary);
            std::cout << in.rdbuf();
            std::cout.flush();
        }
        std::error_code ignored;
        std::filesystem::remove(target, ignored);
    } else if (!failure) {
        context.output.confirm({{"job", id}, {"log", file}});
    }
    return failure;
}

}  // namespace

void addJobCommands(CLI::App& app, Action& chosen)
{
    auto* job = app.add_subcommand("job", "Submit, run and follow jobs");
    job->require_subcommand(1);

    auto submitArguments = std::make_shared<RequestArguments>();
    auto* submitCommand = job->add_subcommand("submit", "Submit a job; prints its ID");
    addRequestOptions(submitCommand, *submitArguments);
    on(submitCommand, chosen, [submitArguments](Context& c) { return submit(c, *submitArguments, nullptr); });

    auto runArguments = std::make_shared<RequestArguments>();
    auto* runCommand = job->add_subcommand("run", "Run a job and wait for its result");
    addRequestOptions(runCommand, *runArguments);
    on(runCommand, chosen, [runArguments](Context& c) { return runJob(c, *runArguments); });

    auto scheduleArguments = std::make_shared<RequestArguments>();
    auto delay = std::make_shared<unsigned>(0);
    auto* scheduleCommand = job->add_subcommand("schedule", "Submit a job to start SECONDS from now");
    scheduleCommand->add_option("SECONDS", *delay, "Delay in seconds")->required();
    addRequestOptions(scheduleCommand, *scheduleArguments);
    on(scheduleCommand, chosen,
       [scheduleArguments, delay](Context& c) { return submit(c, *scheduleArguments, delay.get()); });

    auto id = std::make_shared<unsigned>(0);
    auto* abortCommand = job->add_subcommand("abort", "Abort a job");
    abortCommand->add_option("ID", *id, "Job ID")->required();
    on(abortCommand, chosen, [id](Context& c) -> Outcome {
        if (Outcome failure = c.connection.check(c.connection.session().getTransformationManager()->abortJob(*id)))
            return failure;
        c.output.confirm({{"job", *id}, {"aborted", true}});
        return std::nullopt;
    });

    auto* resultCommand = job->add_subcommand("result", "Show a job's result so far");
    resultCommand->add_option("ID", *id, "Job ID")->required();
    on(resultCommand, chosen, [id](Context& c) -> Outcome {
        const Result result = newResult(c.connection);
        unsigned code = 0;
        if (Outcome failure = fetch(c, *id, result, code))
            return failure;
        c.output.print(describe(c.connection, *result));
        return std::nullopt;
    });

    auto* waitCommand = job->add_subcommand("wait", "Wait until a job has finished; shows its result");
    waitCommand->add_option("ID", *id, "Job ID")->required();
    on(waitCommand, chosen, [id](Context& c) { return wait(c, *id); });

    auto logFile = std::make_shared<std::string>();
    auto* logCommand = job->add_subcommand("log", "Fetch a job's log");
    logCommand->add_option("ID", *id, "Job ID")->required();
    logCommand->add_option("-o,--output", *logFile, "Write the log to FILE instead of standard output");
    on(logCommand, chosen, [id, logFile](Context& c) { return log(c, *id, *logFile); });
}

}  // namespace zelctl
