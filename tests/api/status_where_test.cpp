// Statuses record where the library made them: the operation's own line for the failures it finds
// before sending, never in the public text.

#include <memory>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

#include "api/ZELServerStatus.h"
#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "repository/ZELServerRepository.h"
#include "security/security_factories.h"
#include "sharedresources/ZELServerPath.h"
#include "sharedresources/sharedresources_factories.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

std::string_view fileOf(const IZELServerStatus* status)
{
    const auto* own = dynamic_cast<const ZELServerStatus*>(status);
    return own != nullptr ? own->where().file_name() : "(not the library's status)";
}

TEST(StatusWhere, FailuresBeforeSendingPointAtTheOperationsFile)
{
    ZELServerRepository repository(nullptr);
    const std::unique_ptr<IZELServerSecurityManager> security(makeSecurityManager(nullptr));
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    const ZELServerPath path;
    unsigned flag = 0;
    bool truth = false;
    const struct {
        StatusPtr status;
        unsigned number;
        std::string_view file;
    } cases[] = {
        {StatusPtr(repository.itemExists(ZELServerString("a/b"), flag)), msg::kForbiddenCharacter,
         "repository/ZELServerRepository.cpp"},
        {StatusPtr(repository.itemExists(ZELServerString(""), flag)), msg::kRequiredValueMissing,
         "repository/ZELServerRepository.cpp"},
        {StatusPtr(repository.itemExists(ZELServerString("a"), flag)), msg::kNotConnected,
         "repository/ZELServerRepository.cpp"},
        {StatusPtr(security->userTokenExists(ZELServerString("ann"), truth)), msg::kNotConnected,
         "security/ZELServerSecurityManager.cpp"},
        {StatusPtr(mountPoint->exists(path, flag)), msg::kNotConnected, "sharedresources/ZELServerMountPoint.cpp"},
    };
    for (const auto& c : cases) {
        ASSERT_NE(c.status, nullptr) << c.file;
        EXPECT_EQ(c.status->getMessageNumber(), c.number) << c.file;
        EXPECT_TRUE(fileOf(c.status.get()).ends_with(c.file)) << fileOf(c.status.get()) << " for " << c.file;
        EXPECT_EQ(std::string(c.status->getMessage()).find(".cpp"), std::string::npos) << c.status->getMessage();
    }
}

}  // namespace
}  // namespace zel
