#include "jobs.h"

#include <fcntl.h>
#include <signal.h>
#include <grp.h>
#include <pwd.h>
#include <sys/prctl.h>
#include <poll.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>

#include "framing.h"
#include "item_header.h"
#include "net.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

namespace {

constexpr std::string_view kXmlMarker = " -XML_PARAMETER ";
constexpr int kDeliveryTimeoutMs = 5000;
constexpr int kWaitStepMs = 20;

std::string persistColumns()
{
    return "keyword, request, user, status, time_requested, time_started, time_finished, "
           "result_number, result_message, requester_host, requester_port";
}

void bindRecord(Statement& st, const JobRecord& r, const std::string& user)
{
    st.bind(1, r.keyword).bind(2, r.request).bind(3, user).bind(4, r.status);
    st.bind(5, r.timeRequested).bind(6, r.timeStarted).bind(7, r.timeFinished);
    st.bind(8, r.resultNumber).bind(9, r.resultMessage).bind(10, r.requesterHost);
    st.bind(11, r.requesterPort);
}

bool writeAll(int fd, std::string_view data)
{
    while (!data.empty()) {
        ssize_t n = ::write(fd, data.data(), data.size());
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            return false;
        data.remove_prefix(static_cast<std::size_t>(n));
    }
    return true;
}

}  // namespace

std::string parseJobRequestText(std::string_view text, JobRequestText& out)
{
    out = JobRequestText{};
    std::size_t marker = text.find(kXmlMarker);
    out.workspacePath = std::string(text.substr(0, marker));
    std::vector<std::string> parts = split(out.workspacePath, '/');
    // Clients build the path as REPOSITORY/NAME-LESS-EXTENSION/NAME; the middle part is
    // redundant, and a mismatch means the client built it wrongly.
    if (parts.size() != 3 || parts[0].empty() || parts[2].size() <= 4 ||
        parts[1] != parts[2].substr(0, parts[2].size() - 4))
        return "workspace path '" + out.workspacePath +
               "' is not REPOSITORY/NAME/NAME.zlw (NAME being the workspace name less its extension)";
    out.repository = parts[0];
    out.itemName = parts[2];
    if (marker == std::string_view::npos)
        return {};
    pugi::xml_document doc;
    std::string error = parseXml(text.substr(marker + kXmlMarker.size()), doc);
    if (!error.empty())
        return "request parameters: " + error;
    pugi::xml_node root = doc.document_element();
    if (std::string_view(root.name()) != "TRANSFORMATION_REQUEST")
        return "request parameters: expected a TRANSFORMATION_REQUEST document, not '" + std::string(root.name()) + "'";
    for (pugi::xml_node child : root.children()) {
        std::string_view name = child.name();
        auto entry = std::make_pair(std::string(child.attribute("name").value()), std::string(child.child_value()));
        if (name == "PUBLISHED_PARAMETER")
            out.parameters.push_back(std::move(entry));
        else if (name == "ZEL_DIRECTIVE")
            out.directives.push_back(std::move(entry));
    }
    return {};
}

std::string formatResult(const JobRecord& r)
{
    std::vector<std::pair<std::string, std::string>> entries = {
        {"id", std::to_string(r.id)},       {"jobStatus", r.status},
        {"requestKeyword", r.keyword},      {"request", r.request},
        {"timeRequested", r.timeRequested},
    };
    if (!r.timeStarted.empty())
        entries.emplace_back("timeStarted", r.timeStarted);
    if (!r.timeFinished.empty())
        entries.emplace_back("timeFinished", r.timeFinished);
    if (r.resultNumber >= 0) {
        bool success = r.status == "SUCCESS";
        entries.emplace_back("result", std::to_string(r.resultNumber) + ":" + r.resultMessage);
        entries.emplace_back("resultSuccess", success ? "true" : "false");
        entries.emplace_back("serviceSuccess", r.status == "ZEL_FAILURE" ? "false" : "true");
        entries.emplace_back("serviceMsg", r.resultMessage);
    }
    if (!r.requesterHost.empty()) {
        entries.emplace_back("requesterHost", r.requesterHost);
        entries.emplace_back("requesterResultPort", r.requesterPort);
    }
    std::string text;
    for (const auto& [name, value] : entries) {
        if (!text.empty())
            text.push_back('\0');
        text += name + "=" + value;
    }
    return text;
}

struct JobManager::Job {
    JobRecord record;
    std::string user;
    Clock::time_point due;
    std::vector<std::string> environment;
    std::string dir;
    pid_t pid = 0;  // set while the process is not yet reaped
    bool running = false;
    std::string abortedBy;  // set when an abort was asked for
};

JobManager::JobManager(Database& db, RepositoryStore& repos, Logger& log, const Config& config, std::string jobsDir)
    : db_(db), repos_(repos), log_(log), config_(config), dir_(std::move(jobsDir))
{}

JobManager::~JobManager() { stop(); }

std::string JobManager::open()
{
    std::error_code ec;
    fs::create_directories(dir_, ec);
    if (ec || !fs::is_directory(dir_))
        return "cannot create jobs directory '" + dir_ + "'";
    // A server running as root never runs a workspace as root.
    if (::geteuid() == 0) {
        passwd entry{};
        passwd* found = nullptr;
        char buffer[4096];
        if (::getpwnam_r(config_.jobUser.c_str(), &entry, buffer, sizeof buffer, &found) != 0 || !found)
            return "job_user '" + config_.jobUser + "' is not an account of this machine";
        if (found->pw_uid == 0)
            return "job_user '" + config_.jobUser + "' is root; jobs need an unprivileged account";
        jobAccount_ = JobAccount{found->pw_uid, found->pw_gid};
    }
    std::lock_guard lock(db_.mutex());
    Statement update(db_, "UPDATE jobs SET status = 'ABORTED', time_finished = ?, "
                          "result_number = ?, result_message = 'the server stopped before the "
                          "job finished' WHERE result_number < 0");
    update.bind(1, isoTime(nowSeconds())).bind(2, std::int64_t{kResultStopped});
    if (!update.run())
        return "cannot update jobs: " + update.error();
    return {};
}

void JobManager::start()
{
    for (unsigned i = 0; i < config_.workers; ++i)
        workers_.emplace_back([this] { worker(); });
}

void JobManager::stop()
{
    {
        std::lock_guard lock(mutex_);
        if (stopping_ && workers_.empty())
            return;
        stopping_ = true;
        for (auto& [id, job] : active_)
            if (job->pid > 0)
                ::kill(job->pid, SIGTERM);
    }
    wake_.notify_all();
    for (auto& worker : workers_)
        worker.join();
    workers_.clear();
    std::vector<std::shared_ptr<Job>> left;
    {
        std::lock_guard lock(mutex_);
        for (auto& [id, job] : active_)
            left.push_back(job);
    }
    for (auto& job : left)
        finish(job, "ABORTED", kResultStopped, "the server stopped before the job ran");
}

std::string JobManager::logPath(std::int64_t id) const { return dir_ + "/" + std::to_string(id) + "/job.log"; }

void JobManager::logLine(std::int64_t id, const std::string& line)
{
    UniqueFd fd(::open(logPath(id).c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644));
    if (fd.valid())
        writeAll(fd.get(), "zelserverd: " + line + "\n");
}

std::int64_t JobManager::submit(const JobSubmission& submission, std::string& error)
{
    std::string keyword = trim(submission.keyword);
    if (!config_.findJobService(keyword)) {
        std::string names;
        for (const auto& service : config_.jobServices)
            names += (names.empty() ? "" : ", ") + service.name;
        error = "unknown job service '" + keyword + "' (this server has: " + names + ")";
        return 0;
    }
    JobRequestText parsed;
    error = parseJobRequestText(submission.request, parsed);
    if (!error.empty())
        return 0;
    if (itemKindOf(parsed.itemName) != ItemKind::Workspace) {
        error = "'" + parsed.itemName + "' is not a workspace (.zlw)";
        return 0;
    }
    ItemRecord item;
    UniqueFd workspace = repos_.openItem(parsed.repository, parsed.itemName, &item);
    if (!workspace.valid()) {
        error = "workspace '" + parsed.workspacePath + "' not found";
        return 0;
    }
    ItemHeader header;
    error = parseItemHeader(readHeadOf(workspace.get()), true, header);
    if (!error.empty()) {
        error = "workspace '" + parsed.workspacePath + "' has a bad header: " + error;
        return 0;
    }
    auto job = std::make_shared<Job>();
    std::map<std::string, std::string> values;
    for (const auto& p : header.parameters)
        values[p.name] = p.defaultValue;
    for (const auto& [name, value] : parsed.parameters) {
        if (!header.findParameter(name)) {
            error = "workspace '" + parsed.itemName + "' has no published parameter '" + name + "'";
            return 0;
        }
        values[name] = value;
    }
    job->record.keyword = keyword;
    job->record.request = submission.request;
    job->record.status = submission.delaySeconds ? "DELAYED" : "QUEUED";
    job->record.timeRequested = isoTime(nowSeconds());
    job->record.requesterHost = submission.requesterHost;
    job->record.requesterPort =
        submission.requesterHost.empty() ? std::string() : std::to_string(submission.requesterPort);
    job->user = submission.user;
    job->due = Clock::now() + std::chrono::seconds(submission.delaySeconds);
    job->environment = {"PATH=/usr/local/bin:/usr/bin:/bin", "ZEL_REPOSITORY=" + parsed.repository,
                        "ZEL_WORKSPACE=" + parsed.itemName, "ZEL_USER=" + submission.user};
    for (const auto& [name, value] : values)
        job->environment.push_back(name + "=" + value);
    std::vector<std::string> ignored;
    for (const auto& [name, value] : parsed.directives) {
        if (isShellIdentifier(name))
            job->environment.push_back("ZEL_DIRECTIVE_" + name + "=" + value);
        else
            ignored.push_back(name);
    }

    {
        std::lock_guard lock(db_.mutex());
        Statement insert(db_, "INSERT INTO jobs (" + persistColumns() + ") VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)");
        bindRecord(insert, job->record, job->user);
        if (!insert.run()) {
            error = "cannot record job: " + insert.error();
            return 0;
        }
        job->record.id = db_.lastInsertId();
    }
    std::int64_t id = job->record.id;
    job->dir = dir_ + "/" + std::to_string(id);
    job->environment.push_back("ZEL_JOB_ID=" + std::to_string(id));
    job->environment.push_back("HOME=" + job->dir + "/work");
    error = prepare(*job, submission, workspace.get());
    if (!error.empty()) {
        finish(job, "ZEL_FAILURE", kResultNotRun, error);
        return 0;
    }
    for (const auto& name : ignored)
        logLine(id, "embedded directive '" + name + "' ignored (not a shell identifier)");
    for (const auto& [name, value] : values)
        logLine(id, "parameter " + name + "=" + value);
    {
        std::lock_guard lock(mutex_);
        if (stopping_) {
            error = "the server is stopping";
        } else {
            active_[id] = job;
        }
    }
    if (!error.empty()) {
        finish(job, "ABORTED", kResultStopped, error);
        return 0;
    }
    wake_.notify_one();
    return id;
}

std::string JobManager::prepare(Job& job, const JobSubmission& submission, int workspaceFd)
{
    std::error_code ec;
    fs::create_directories(job.dir + "/work", ec);
    if (ec)
        return "cannot create job directory: " + ec.message();
    if (jobAccount_ && ::chown((job.dir + "/work").c_str(), jobAccount_->uid, jobAccount_->gid) != 0)
        return std::string("cannot hand the job directory to the job's account: ") + std::strerror(errno);
    // The job runs the workspace as it was when submitted, whatever happens to the item later.
    UniqueFd copy(::open((job.dir + "/workspace").c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644));
    if (!copy.valid())
        return std::string("cannot copy workspace: ") + std::strerror(errno);
    char buffer[65536];
    for (;;) {
        ssize_t n = ::read(workspaceFd, buffer, sizeof buffer);
        if (n == 0)
            break;
        if (n < 0 || !writeAll(copy.get(), std::string_view(buffer, static_cast<std::size_t>(n))))
            return std::string("cannot copy workspace: ") + std::strerror(errno);
    }
    std::int64_t id = job.record.id;
    logLine(id, "job " + std::to_string(id) + " submitted by " + job.user + " at " + job.record.timeRequested +
                    " to service " + job.record.keyword);
    logLine(id, "request " + job.record.request);
    if (submission.delaySeconds)
        logLine(id, "delayed by " + std::to_string(submission.delaySeconds) + " seconds");
    if (!job.record.requesterHost.empty())
        logLine(id, "result goes to " + job.record.requesterHost + ":" + job.record.requesterPort);
    for (const auto& note : submission.notifications)
        logLine(id, "notification '" + note + "' not sent (this server sends no notifications)");
    return {};
}

std::shared_ptr<JobManager::Job> JobManager::nextDue(Clock::time_point now)
{
    for (auto& [id, job] : active_)
        if (!job->running && job->due <= now)
            return job;
    return nullptr;
}

void JobManager::worker()
{
    std::unique_lock lock(mutex_);
    while (!stopping_) {
        auto now = Clock::now();
        std::shared_ptr<Job> job = nextDue(now);
        if (!job) {
            std::optional<Clock::time_point> next;
            for (auto& [id, j] : active_)
                if (!j->running && (!next || j->due < *next))
                    next = j->due;
            if (next)
                wake_.wait_until(lock, *next);
            else
                wake_.wait(lock);
            continue;
        }
        job->running = true;
        job->record.status = "IN_PROCESS";
        job->record.timeStarted = isoTime(nowSeconds());
        lock.unlock();
        run(*job);
        lock.lock();
    }
}

namespace {

// Everything the job's processes need, made before fork: a server with threads may only make
// async-signal-safe calls in a forked child, so nothing below allocates.
struct Launch {
    std::vector<char*> argv;
    std::vector<char*> envp;
    int logFd = -1;
    int scriptFd = -1;
    const char* workDir = nullptr;
    bool dropPrivileges = false;
    uid_t uid = 0;
    gid_t gid = 0;
};

// The shell, in a process group of its own: the plain signal state, standard input from
// /dev/null, output to the log, the workspace on descriptor 3 and nothing else open, the job's
// account when the server runs as root.
[[noreturn]] void execShell(const Launch& launch)
{
    ::setpgid(0, 0);
    sigset_t none;
    sigemptyset(&none);
    ::sigprocmask(SIG_SETMASK, &none, nullptr);
    for (int s : {SIGPIPE, SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGCHLD})
        ::signal(s, SIG_DFL);
    int devNull = ::open("/dev/null", O_RDONLY);
    bool ok = devNull >= 0 && ::dup2(devNull, 0) == 0 && ::dup2(launch.logFd, 1) == 1 && ::dup2(launch.logFd, 2) == 2 &&
              ::dup2(launch.scriptFd, 3) == 3 && ::close_range(4, ~0u, 0) == 0 && ::chdir(launch.workDir) == 0;
    if (ok && launch.dropPrivileges)
        ok = ::setgroups(0, nullptr) == 0 && ::setgid(launch.gid) == 0 && ::setuid(launch.uid) == 0;
    if (ok)
        ::execve("/bin/sh", launch.argv.data(), launch.envp.data());
    ::_exit(127);
}

// The pids in "/proc/self/task/TID/children", read without allocating; 0 ends the list.
void childrenOf(pid_t self, pid_t (&out)[256])
{
    char path[64] = "/proc/self/task/";
    char digits[16];
    int n = 0;
    for (pid_t v = self; v > 0; v /= 10)
        digits[n++] = static_cast<char>('0' + v % 10);
    std::size_t at = std::strlen(path);
    while (n > 0)
        path[at++] = digits[--n];
    std::memcpy(path + at, "/children", 10);
    out[0] = 0;
    int fd = ::open(path, O_RDONLY | O_CLOEXEC);
    if (fd < 0)
        return;
    char text[4096];
    ssize_t size = ::read(fd, text, sizeof text - 1);
    ::close(fd);
    std::size_t count = 0;
    pid_t value = 0;
    for (ssize_t i = 0; i < size && count < 255; ++i) {
        if (text[i] >= '0' && text[i] <= '9') {
            value = value * 10 + (text[i] - '0');
        } else if (value > 0) {
            out[count++] = value;
            value = 0;
        }
    }
    out[count] = 0;
}

// Kills the shell's group and every process still below the supervisor. As a subreaper the
// supervisor inherits whatever a killed process leaves behind (a `setsid` daemon too), so it
// repeats until it has no child left.
void killDescendants(pid_t shell)
{
    ::kill(-shell, SIGKILL);
    pid_t self = ::getpid();
    for (;;) {
        pid_t children[256];
        childrenOf(self, children);
        for (pid_t* p = children; *p; ++p)
            ::kill(*p, SIGKILL);
        if (::waitpid(-1, nullptr, 0) < 0 && errno == ECHILD)
            return;
    }
}

// The job's supervisor: starts the shell, waits for it, then kills everything the job left
// behind; SIGTERM (an abort, a time-out, the server stopping or dying) kills everything at once.
// It ends the way the shell did.
[[noreturn]] void supervise(const Launch& launch)
{
    ::setpgid(0, 0);
    ::prctl(PR_SET_CHILD_SUBREAPER, 1);
    ::prctl(PR_SET_PDEATHSIG, SIGTERM);
    sigset_t wanted;
    sigemptyset(&wanted);
    sigaddset(&wanted, SIGCHLD);
    sigaddset(&wanted, SIGTERM);
    ::sigprocmask(SIG_BLOCK, &wanted, nullptr);
    pid_t shell = ::fork();
    if (shell == 0)
        execShell(launch);
    int status = 127 << 8;
    bool ended = shell < 0;
    while (!ended) {
        siginfo_t info{};
        if (::sigwaitinfo(&wanted, &info) < 0)
            continue;
        if (info.si_signo == SIGTERM)
            break;
        int st = 0;
        for (pid_t p; (p = ::waitpid(-1, &st, WNOHANG)) > 0;)
            if (p == shell) {
                status = st;
                ended = true;
            }
    }
    if (shell > 0)
        killDescendants(shell);
    if (WIFSIGNALED(status)) {
        ::signal(WTERMSIG(status), SIG_DFL);
        ::sigprocmask(SIG_UNBLOCK, &wanted, nullptr);
        ::kill(::getpid(), WTERMSIG(status));
    }
    ::_exit(WIFEXITED(status) ? WEXITSTATUS(status) : 127);
}

}  // namespace

pid_t JobManager::spawn(Job& job, std::string& error)
{
    UniqueFd logFd(::open(logPath(job.record.id).c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644));
    UniqueFd scriptFd(::open((job.dir + "/workspace").c_str(), O_RDONLY | O_CLOEXEC));
    if (!logFd.valid() || !scriptFd.valid()) {
        error = std::string("cannot open the job log or workspace: ") + std::strerror(errno);
        return 0;
    }
    std::string work = job.dir + "/work";
    Launch launch;
    // The workspace is read through the descriptor the server opened: naming it as /dev/fd/3 would
    // reopen the file with the job account's rights, which the server's private copy does not grant.
    static const char kRunScript[] = "script=$(cat <&3) && exec 3<&- && eval \"$script\"";
    launch.argv = {const_cast<char*>("sh"), const_cast<char*>("-c"), const_cast<char*>(kRunScript),
                   const_cast<char*>("sh"), nullptr};
    for (auto& entry : job.environment)
        launch.envp.push_back(entry.data());
    launch.envp.push_back(nullptr);
    launch.logFd = logFd.get();
    launch.scriptFd = scriptFd.get();
    launch.workDir = work.c_str();
    launch.dropPrivileges = jobAccount_.has_value();
    if (jobAccount_) {
        launch.uid = jobAccount_->uid;
        launch.gid = jobAccount_->gid;
    }
    pid_t pid = ::fork();
    if (pid == 0)
        supervise(launch);
    if (pid < 0) {
        error = std::string("cannot start the job: ") + std::strerror(errno);
        return 0;
    }
    return pid;
}

// Blocks until the supervisor has ended, stopping it when the job time-out passes first; true when
// it did. The supervisor is left a zombie (WNOWAIT), so its pid stays taken until it is reaped and
// a signal for it cannot hit a stranger that reused the number.
bool JobManager::waitForExit(pid_t pid)
{
    // A pidfd becomes readable when the process ends: no polling interval stands between a job's
    // end and its result. Kernels without pidfd_open fall back to looking every kWaitStep.
    UniqueFd exitFd(static_cast<int>(::syscall(SYS_pidfd_open, pid, 0)));
    auto deadline = Clock::now() + std::chrono::seconds(config_.jobTimeoutSeconds);
    bool timedOut = false;
    for (;;) {
        siginfo_t info{};
        int rc = ::waitid(P_PID, static_cast<id_t>(pid), &info, WEXITED | WNOHANG | WNOWAIT);
        if ((rc == 0 && info.si_pid == pid) || (rc != 0 && errno != EINTR))
            return timedOut;
        bool limited = config_.jobTimeoutSeconds && !timedOut;
        if (limited && Clock::now() >= deadline) {
            timedOut = true;
            ::kill(pid, SIGTERM);
            continue;
        }
        auto left = std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now()).count() + 1;
        int waitMs = limited ? static_cast<int>(std::min<long long>(left, INT32_MAX)) : -1;
        if (!exitFd.valid())
            waitMs = waitMs < 0 ? kWaitStepMs : std::min(waitMs, kWaitStepMs);
        pollfd p{exitFd.get(), POLLIN, 0};
        ::poll(&p, 1, waitMs);
    }
}

void JobManager::run(Job& job)
{
    std::int64_t id = job.record.id;
    {
        std::lock_guard lock(db_.mutex());
        Statement update(db_, "UPDATE jobs SET status = ?, time_started = ? WHERE id = ?");
        update.bind(1, job.record.status).bind(2, job.record.timeStarted).bind(3, id);
        update.run();
    }
    logLine(id, "started at " + job.record.timeStarted);
    std::shared_ptr<Job> self;
    {
        std::lock_guard lock(mutex_);
        self = active_[id];
    }
    std::string error;
    pid_t pid = spawn(job, error);
    if (pid == 0) {
        finish(self, "ZEL_FAILURE", kResultNotRun, error);
        return;
    }
    {
        std::lock_guard lock(mutex_);
        job.pid = pid;
        // An abort or a stop that came while the process was being started must still reach it.
        if (!job.abortedBy.empty() || stopping_)
            ::kill(pid, SIGTERM);
    }
    bool timedOut = waitForExit(pid);
    int status = 0;
    std::string abortedBy;
    bool stopped;
    {
        std::lock_guard lock(mutex_);
        // The supervisor has killed whatever the workspace left running before it ended.
        ::waitpid(pid, &status, 0);
        job.pid = 0;
        abortedBy = job.abortedBy;
        stopped = stopping_;
    }
    if (!abortedBy.empty()) {
        finish(self, "ABORTED", kResultAborted, "job aborted by " + abortedBy);
    } else if (timedOut) {
        finish(self, "JOB_FAILURE", kResultTimeout,
               "job timed out after " + std::to_string(config_.jobTimeoutSeconds) + " seconds");
    } else if (stopped) {
        finish(self, "ABORTED", kResultStopped, "the server stopped before the job finished");
    } else if (WIFEXITED(status) && WEXITSTATUS(status) == 0) {
        finish(self, "SUCCESS", kResultSuccess, "Translation was successful");
    } else if (WIFEXITED(status)) {
        finish(self, "JOB_FAILURE", WEXITSTATUS(status),
               "workspace exited with status " + std::to_string(WEXITSTATUS(status)));
    } else {
        finish(self, "JOB_FAILURE", kResultSignal, "workspace ended by signal " + std::to_string(WTERMSIG(status)));
    }
}

void JobManager::finish(const std::shared_ptr<Job>& job, std::string_view status, std::int64_t number,
                        const std::string& message)
{
    JobRecord record;
    {
        std::lock_guard lock(mutex_);
        record = job->record;
    }
    record.status = std::string(status);
    record.timeFinished = isoTime(nowSeconds());
    record.resultNumber = number;
    record.resultMessage = message;
    // The log's last line and the database come first: whoever sees the job as ended may read
    // both at once.
    logLine(record.id, "finished at " + record.timeFinished + " with " + record.status + " (" + std::to_string(number) +
                           ":" + message + ")");
    {
        std::lock_guard lock(db_.mutex());
        Statement update(db_, "UPDATE jobs SET status = ?, time_started = ?, time_finished = ?, "
                              "result_number = ?, result_message = ? WHERE id = ?");
        update.bind(1, record.status).bind(2, record.timeStarted).bind(3, record.timeFinished);
        update.bind(4, record.resultNumber).bind(5, record.resultMessage).bind(6, record.id);
        if (!update.run())
            log_.info("job " + std::to_string(record.id) + ": " + update.error());
    }
    {
        std::lock_guard lock(mutex_);
        job->record = record;
        active_.erase(record.id);
    }
    ended_.notify_all();
    if (!record.requesterHost.empty())
        deliver(*job, formatResult(record));
}

void JobManager::deliver(const Job& job, const std::string& text)
{
    std::string error;
    std::int64_t id = job.record.id;
    auto port = static_cast<std::uint16_t>(std::stoul(job.record.requesterPort));
    UniqueFd fd = connectTo(job.record.requesterHost, port, kDeliveryTimeoutMs, error);
    std::string frame = encodeFrame(text);
    if (fd.valid() && sendAll(fd.get(), frame.data(), frame.size(), kDeliveryTimeoutMs)) {
        logLine(id, "result sent to " + job.record.requesterHost + ":" + job.record.requesterPort);
        return;
    }
    if (error.empty())
        error = "the result port closed before the result was sent";
    logLine(id, "result not delivered: " + error);
    log_.info("job " + std::to_string(id) + ": result not delivered: " + error);
}

std::string JobManager::abort(std::int64_t id, const std::string& user)
{
    std::unique_lock lock(mutex_);
    auto it = active_.find(id);
    if (it == active_.end()) {
        lock.unlock();
        return resultText(id) ? "job " + std::to_string(id) + " has already ended"
                              : "unknown job " + std::to_string(id);
    }
    std::shared_ptr<Job> job = it->second;
    if (!job->running) {
        active_.erase(it);
        lock.unlock();
        finish(job, "ABORTED", kResultAborted, "job aborted by " + user);
        return {};
    }
    job->abortedBy = user;
    if (job->pid > 0)
        ::kill(job->pid, SIGTERM);
    bool ended = ended_.wait_for(lock, std::chrono::seconds(10), [&] { return !active_.count(id); });
    return ended ? std::string() : "job " + std::to_string(id) + " did not end in time";
}

std::optional<std::string> JobManager::owner(std::int64_t id)
{
    {
        std::lock_guard lock(mutex_);
        auto it = active_.find(id);
        if (it != active_.end())
            return it->second->user;
    }
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT user FROM jobs WHERE id = ?");
    one.bind(1, id);
    if (!one.step())
        return std::nullopt;
    return one.text(0);
}

std::optional<std::string> JobManager::resultText(std::int64_t id)
{
    {
        std::lock_guard lock(mutex_);
        auto it = active_.find(id);
        if (it != active_.end()) {
            JobRecord record = it->second->record;
            if (record.status == "DELAYED" && it->second->due <= Clock::now())
                record.status = "QUEUED";
            return formatResult(record);
        }
    }
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT " + persistColumns() + " FROM jobs WHERE id = ?");
    one.bind(1, id);
    if (!one.step())
        return std::nullopt;
    JobRecord r;
    r.id = id;
    r.keyword = one.text(0);
    r.request = one.text(1);
    r.status = one.text(3);
    r.timeRequested = one.text(4);
    r.timeStarted = one.text(5);
    r.timeFinished = one.text(6);
    r.resultNumber = one.integer(7);
    r.resultMessage = one.text(8);
    r.requesterHost = one.text(9);
    r.requesterPort = one.text(10);
    return formatResult(r);
}

}  // namespace zelserverd
