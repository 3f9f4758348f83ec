#include "repository_fixture.h"

#include <chrono>
#include <filesystem>
#include <thread>

namespace zeltest {

std::map<std::string, std::string> parseResult(const std::string& text) {
  std::map<std::string, std::string> entries;
  std::size_t start = 0;
  while (start <= text.size()) {
    std::size_t end = text.find('\0', start);
    if (end == std::string::npos) end = text.size();
    std::string entry = text.substr(start, end - start);
    std::size_t eq = entry.find('=');
    if (eq != std::string::npos) entries[entry.substr(0, eq)] = entry.substr(eq + 1);
    start = end + 1;
  }
  return entries;
}

std::string requestText(const std::string& workspace, const Values& parameters) {
  std::string stem = workspace.substr(0, workspace.size() - 4);
  std::string xml = "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?>"
                    "<TRANSFORMATION_REQUEST>";
  for (const auto& [name, value] : parameters)
    xml += "<PUBLISHED_PARAMETER name=\"" + name + "\">" + value + "</PUBLISHED_PARAMETER>";
  xml += "</TRANSFORMATION_REQUEST>";
  return "REPO/" + stem + "/" + workspace + " -XML_PARAMETER " + xml;
}

void RepositoryFixture::SetUp() {
  ServerFixture::SetUp();
  admin_ = connectAs("admin");
  WireReply added = admin_->command(
      "REP_ADD_REPOSITORY",
      {{"repositoryObject", "<REP_ADD_REPOSITORY><REPOSITORY name=\"REPO\" "
                            "description=\"Test repository\"/></REP_ADD_REPOSITORY>"}});
  ASSERT_TRUE(added.ok()) << added.body;
}

void RepositoryFixture::TearDown() {
  admin_.reset();
  ServerFixture::TearDown();
}

WireReply RepositoryFixture::addItem(const std::string& name, const std::string& content,
                                     const std::string& keyword) {
  return admin_->upload(keyword,
                        {{"repositoryName", "REPO"},
                         {"itemName", name},
                         {"itemFileCRCCheckingEnabled", "true"}},
                        content);
}

WireReply RepositoryFixture::addResource(const std::string& item, const std::string& name,
                                         const std::string& content, const std::string& keyword) {
  return admin_->upload(keyword,
                        {{"repositoryName", "REPO"},
                         {"itemName", item},
                         {"resourceName", name},
                         {"resourceFileCRCCheckingEnabled", "false"}},
                        content);
}

long RepositoryFixture::submit(const std::string& workspace, const Values& parameters,
                               const Values& extra) {
  Values values = {{"keyword", "zeljob"}, {"request", requestText(workspace, parameters)}};
  values.insert(values.end(), extra.begin(), extra.end());
  lastReply_ = admin_->command("JOB_REQUEST", values);
  return lastReply_.ok() ? std::stol(lastReply_.body) : 0;
}

std::map<std::string, std::string> RepositoryFixture::result(long id) {
  return parseResult(admin_->command("GET_JOB_RESULT_STRING", {{"jobID", std::to_string(id)}}).body);
}

std::map<std::string, std::string> RepositoryFixture::waitForEnd(long id) {
  auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  std::map<std::string, std::string> last;
  while (std::chrono::steady_clock::now() < deadline) {
    last = result(id);
    const std::string& status = last["jobStatus"];
    if (status != "QUEUED" && status != "DELAYED" && status != "IN_PROCESS") return last;
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  return last;
}

std::size_t RepositoryFixture::storedFiles() {
  std::size_t n = 0;
  for (const auto& entry : std::filesystem::directory_iterator(dataDir_ + "/store")) {
    (void)entry;
    ++n;
  }
  return n;
}

}  // namespace zeltest
