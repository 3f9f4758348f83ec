// A server with one repository "REPO" and helpers for items, jobs and result texts.
#pragma once

#include <map>
#include <memory>
#include <string>

#include "server_fixture.h"

namespace zeltest {

// A result text split into its name=value entries.
std::map<std::string, std::string> parseResult(const std::string& text);
// A "TRANSFORMATION_REQUEST" request text for REPO/NAME/NAME.zlw with published parameters.
std::string requestText(const std::string& workspace, const Values& parameters = {});

class RepositoryFixture : public ServerFixture {
 protected:
  void SetUp() override;
  void TearDown() override;

  WireReply addItem(const std::string& name, const std::string& content,
                    const std::string& keyword = "REP_ADD_ITEM");
  WireReply addResource(const std::string& item, const std::string& name,
                        const std::string& content,
                        const std::string& keyword = "REP_ADD_ITEMRESOURCE");
  // Submits a job; its id, or 0 (the reply is kept in lastReply_).
  long submit(const std::string& workspace, const Values& parameters = {},
              const Values& extra = {});
  // Polls until the job has ended (or 20 seconds pass); the last result seen.
  std::map<std::string, std::string> waitForEnd(long id);
  std::map<std::string, std::string> result(long id);
  // Number of files in the content directory.
  std::size_t storedFiles();

  std::unique_ptr<TestClient> admin_;
  WireReply lastReply_;
};

}  // namespace zeltest
