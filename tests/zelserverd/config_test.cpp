#include <gtest/gtest.h>

#include <string>

#include "auth.h"
#include "config.h"

using zelserverd::Config;

TEST(Config, ReadsEverySectionKind) {
  Config config;
  std::string error = zelserverd::parseConfig(R"(
# comment
; also a comment
[server]
listen = 0.0.0.0:9000
workers = 4
max_request_bytes = 2048
max_file_bytes = 1000
job_timeout_seconds = 60
sso_secret = s3

[role ops]
rights = jobs, sharedresources.read

[user ann]
password = pw = with equals
roles = user, ops

[sharedresource DATA]
path = data/files
display_name = Data files
description = Inputs

[sharedresource ABS]
path = /srv/abs/../abs2

[jobservice convert]
description = Conversions
)",
                                              "/etc/zel", config);
  ASSERT_EQ(error, "");
  EXPECT_EQ(config.listenHost, "0.0.0.0");
  EXPECT_EQ(config.listenPort, 9000);
  EXPECT_EQ(config.workers, 4u);
  EXPECT_EQ(config.maxRequestBytes, 2048u);
  EXPECT_EQ(config.maxFileBytes, 1000u);
  EXPECT_EQ(config.jobTimeoutSeconds, 60u);
  EXPECT_EQ(config.ssoSecret, "s3");
  ASSERT_NE(config.findUser("ann"), nullptr);
  EXPECT_EQ(config.findUser("ann")->password, "pw = with equals");
  EXPECT_EQ(config.findUser("ann")->roles, (std::vector<std::string>{"user", "ops"}));
  ASSERT_NE(config.findSharedResource("DATA"), nullptr);
  EXPECT_EQ(config.findSharedResource("DATA")->path, "/etc/zel/data/files");
  EXPECT_EQ(config.findSharedResource("DATA")->displayName, "Data files");
  EXPECT_EQ(config.findSharedResource("ABS")->path, "/srv/abs2");
  EXPECT_EQ(config.findSharedResource("ABS")->displayName, "ABS");
  ASSERT_EQ(config.jobServices.size(), 1u);
  EXPECT_EQ(config.jobServices[0].name, "convert");
  EXPECT_EQ(zelserverd::rightsOfRoles(config, {"ops"}),
            zelserverd::kRightJobs | zelserverd::kRightSharedRead);
}

TEST(Config, DefaultsWhenSectionsAreAbsent) {
  Config config;
  ASSERT_EQ(zelserverd::parseConfig("", "/", config), "");
  EXPECT_EQ(config.listenHost, "127.0.0.1");
  EXPECT_EQ(config.listenPort, zelserverd::kDefaultPort);
  EXPECT_EQ(config.maxRequestBytes, zelserverd::kDefaultMaxRequestBytes);
  ASSERT_EQ(config.jobServices.size(), 1u);
  EXPECT_EQ(config.jobServices[0].name, zelserverd::kDefaultJobService);
  EXPECT_TRUE(config.users.empty());
}

TEST(Config, ReportsTheFaultyLine) {
  struct Case {
    const char* text;
    const char* expected;
  };
  const Case cases[] = {
      {"[server]\nlisten = nowhere", "line 2: bad listen address"},
      {"[server]\nworkers = 0", "line 2: workers must be 1 to 64"},
      {"[server]\nmax_request_bytes = 10", "line 2: max_request_bytes must be at least 1024"},
      {"[server]\ncolour = red", "line 2: unknown server key 'colour'"},
      {"key = value", "line 1: 'key' outside of any section"},
      {"[user]", "line 1: section [user] needs a name"},
      {"[planet earth]", "line 1: unknown section kind 'planet'"},
      {"[server", "line 1: section header must end with ']'"},
      {"[user a]\npassword = x\n[user a]", "line 3: user 'a' defined twice"},
      {"[role r]\nrights = jobs, flying", "line 2: unknown right 'flying'"},
      {"[user a]\nroles = admin", "user 'a' has no password"},
      {"[user a]\npassword = x", "user 'a' has no roles"},
      {"[user a]\npassword = x\nroles = emperor", "user 'a' has unknown role 'emperor'"},
      {"[sharedresource S]\ndisplay_name = s", "shared resource 'S' has no path"},
      {"[server]\nno equals sign", "line 2: expected 'key = value'"},
  };
  for (const Case& c : cases) {
    Config config;
    EXPECT_EQ(zelserverd::parseConfig(c.text, "/", config), c.expected) << c.text;
  }
}

TEST(Config, BuiltInRolesNestTheirRights) {
  Config config;
  auto rights = [&](const char* role) { return zelserverd::rightsOfRoles(config, {role}); };
  EXPECT_EQ(rights("admin"), zelserverd::kRightAll);
  EXPECT_EQ(rights("viewer") & zelserverd::kRightSharedWrite, 0u);
  EXPECT_NE(rights("user") & zelserverd::kRightSharedWrite, 0u);
  EXPECT_EQ(rights("user") & zelserverd::kRightRepositoryWrite, 0u);
  EXPECT_NE(rights("author") & zelserverd::kRightRepositoryWrite, 0u);
  EXPECT_EQ(rights("author") & zelserverd::kRightRepositoryAdmin, 0u);
  EXPECT_EQ(rights("nobody"), 0u);
}
