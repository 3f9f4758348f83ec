#include "server_fixture.h"

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <regex>
#include <sstream>
#include <thread>

namespace zeltest {

std::vector<std::string> entriesOf(const std::string& dir)
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(dir))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

bool eventually(const std::function<bool()>& condition)
{
    auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > deadline)
            return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    return true;
}

std::string document(const std::string& elements) { return "<?xml version=\"1.0\"?>" + elements; }

std::string withoutTimes(const std::string& text)
{
    static const std::regex stamp("[0-9]{4}-[0-9]{2}-[0-9]{2}T[0-9]{2}:[0-9]{2}:[0-9]{2}Z");
    return std::regex_replace(text, stamp, "TIME");
}

void ServerFixture::SetUp()
{
    dataDir_ = root_ + "/data";
    areaDir_ = root_ + "/area";
    configPath_ = root_ + "/zelserverd.conf";
    std::filesystem::create_directories(areaDir_);
    spew(configPath_, std::string("[server]\nworkers = 2\nmax_request_bytes = 65536\n"
                                  "sso_secret = ") +
                          kSsoSecret + R"(
[role auditor]
rights = sharedresources.read
[user admin]
password = adminpw
roles = admin
[user ann]
password = annpw
roles = user
[user vic]
password = vicpw
roles = viewer
[user aud]
password = audpw
roles = auditor
[sharedresource AREA]
path = area
[jobservice zeljob]
)");
    startServer();
    WireReply added = admin_->command("REP_ADD_REPOSITORY",
                                      {{"repositoryObject", "<REP_ADD_REPOSITORY><REPOSITORY name=\"REPO\" "
                                                            "description=\"Test repository\"/></REP_ADD_REPOSITORY>"}});
    ASSERT_TRUE(added.ok()) << added.body;
}

void ServerFixture::TearDown() { stopServer(); }

void ServerFixture::startServer()
{
    stopServer();
    zelserverd::ServerOptions options;
    options.dataDir = dataDir_;
    options.configFile = configPath_;
    options.listen = "127.0.0.1:0";
    options.quiet = true;
    std::string error;
    server_ = zelserverd::Server::create(options, error);
    ASSERT_TRUE(server_) << error;
    server_->start();
    admin_ = connectAs("admin");
}

void ServerFixture::stopServer()
{
    admin_.reset();
    if (server_)
        server_->stop();
    server_.reset();
}

void ServerFixture::restartWith(const std::string& settings)
{
    spew(configPath_, slurp(configPath_) + "\n[server]\n" + settings + "\n");
    startServer();
}

std::unique_ptr<TestClient> ServerFixture::connectAs(const std::string& user)
{
    auto client = std::make_unique<TestClient>();
    EXPECT_TRUE(client->connect(port()));
    WireReply reply = client->signIn(user, user + "pw");
    EXPECT_TRUE(reply.ok()) << reply.body;
    return client;
}

std::string ServerFixture::userOf(TestClient& client)
{
    return client.command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body;
}

static std::map<std::string, std::string> parseResult(const std::string& text)
{
    std::map<std::string, std::string> entries;
    std::istringstream in(text);
    for (std::string entry; std::getline(in, entry, '\0');)
        if (std::size_t eq = entry.find('='); eq != std::string::npos)
            entries[entry.substr(0, eq)] = entry.substr(eq + 1);
    return entries;
}

std::string requestText(const std::string& workspace, const Values& parameters)
{
    std::string stem = workspace.substr(0, workspace.size() - 4);
    std::string xml = "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?>"
                      "<TRANSFORMATION_REQUEST>";
    for (const auto& [name, value] : parameters)
        xml += "<PUBLISHED_PARAMETER name=\"" + name + "\">" + value + "</PUBLISHED_PARAMETER>";
    xml += "</TRANSFORMATION_REQUEST>";
    return "REPO/" + stem + "/" + workspace + " -XML_PARAMETER " + xml;
}

WireReply ServerFixture::addItem(const std::string& name, const std::string& content, const std::string& keyword)
{
    return admin_->upload(
        keyword, {{"repositoryName", "REPO"}, {"itemName", name}, {"itemFileCRCCheckingEnabled", "true"}}, content);
}

long ServerFixture::submit(const std::string& workspace, const Values& parameters, const Values& extra)
{
    Values values = {{"keyword", "zeljob"}, {"request", requestText(workspace, parameters)}};
    values.insert(values.end(), extra.begin(), extra.end());
    lastReply_ = admin_->command("JOB_REQUEST", values);
    return lastReply_.ok() ? std::stol(lastReply_.body) : 0;
}

std::map<std::string, std::string> ServerFixture::result(long id)
{
    return parseResult(admin_->command("GET_JOB_RESULT_STRING", {{"jobID", std::to_string(id)}}).body);
}

std::string ServerFixture::jobFile(long id, const std::string& name) const
{
    return dataDir_ + "/jobs/" + std::to_string(id) + "/work/" + name;
}

std::map<std::string, std::string> ServerFixture::waitForEnd(long id)
{
    std::map<std::string, std::string> last;
    eventually([&] {
        last = result(id);
        return last["jobStatus"] != "QUEUED" && last["jobStatus"] != "DELAYED" && last["jobStatus"] != "IN_PROCESS";
    });
    return last;
}

}  // namespace zeltest
