// Statuses built and destroyed on several threads at once, with the library's catalogue and the
// framework's catalogue giving different texts: a teardown slipping in between one status's start-up
// and its look-up would send that look-up to the framework's catalogue, which shows in the text.

#include <atomic>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "api/status.h"
#include "session/message_startup.h"
#include "support/environment.h"

namespace {

void writeCatalogue(const zeltest::TempDir& home, const std::string& text)
{
    std::filesystem::create_directories(home.path() / "messages");
    std::ofstream(home.path() / "messages" / "zelserverapi.msg", std::ios::binary) << "393623 " << text << " %1\n";
}

TEST(MessageCatalogue, EveryStatusOnEveryThreadReadsTheLibrarysOwnCatalogue)
{
    const zeltest::TempDir library("zel-library");
    const zeltest::TempDir framework("zel-framework");
    writeCatalogue(library, "library");
    writeCatalogue(framework, "framework");
    const zeltest::ScopedEnv home("ZEL_SERVERAPI_HOME", library.path().string());
    const zeltest::ScopedEnv frameworkHome("ZEL_HOME", framework.path().string());

    std::atomic<int> wrong{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&wrong, t] {
            for (int i = 0; i < 1000; ++i) {
                const std::string name = std::string("f").append(std::to_string(t * 1000 + i));
                const std::unique_ptr<IZELServerStatus> status(zel::makeStatus(zel::msg::kLocalFileRead, name));
                if (std::string(status->getMessage()) != "library " + name) {
                    ++wrong;
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong.load(), 0);
    EXPECT_FALSE(zel::messageDatabaseStarted());
}

}  // namespace
