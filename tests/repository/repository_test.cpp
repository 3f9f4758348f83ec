// Repository operations on the wire: every command family byte for byte, the argument checks and
// their deliberate exceptions, uploads, the item download through a temporary file, the resource
// download straight into its destination, and the view filters.

#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "repository/ZELServerRepository.h"
#include "repository/ZELServerService.h"
#include "repository/ZELServerWorkspace.h"
#include "repository/repository_objects.h"
#include "repository_fixture.h"
#include "support/platform.h"

namespace zel::repotest {
namespace {

namespace fs = std::filesystem;
using namespace std::string_literals;

const std::string kForbidden = "\\/:*?\"<>|&='+%";

class RepositoryTest : public RepositoryWireTest {
protected:
    // A command of this repository: its name first, then the command's own values.
    static Bytes repoCommand(const std::string& keyword, zeltest::Values values = {})
    {
        values.insert(values.begin(), {"repositoryName", "Samples"});
        return command(keyword, values);
    }

    ZELServerRepository repository{channel.get(), S("Samples"), S("sample workspaces")};
};

using zeltest::ProgressLog;

// ---- Items ------------------------------------------------------------------------------------------

TEST_F(RepositoryTest, FlagsAreSetOnlyByTheExactTruthValueAndClearedByErrors)
{
    server.exchange(repoCommand("REP_ITEMEXISTS", {{"itemName", "roads.zlw"}}), success("true"))
        .exchange(repoCommand("REP_REMOVE_ITEM", {{"itemName", "a.zlw"}}), success("True"))
        .exchange(repoCommand("REP_ITEMRESOURCEEXISTS", {{"itemName", "a.zlw"}, {"resourceName", "r.csv"}}),
                  zeltest::reply("ERROR", "Authorization Error: no rights"));
    signIn();
    unsigned exists = 7;
    unsigned removed = 7;
    unsigned resource = 7;
    EXPECT_EQ(StatusPtr(repository.itemExists(S("roads.zlw"), exists)), nullptr);
    EXPECT_EQ(exists, 1u);
    EXPECT_EQ(StatusPtr(repository.removeItem(S("a.zlw"), removed)), nullptr) << "no truth value is no failure";
    EXPECT_EQ(removed, 0u);
    const StatusPtr error(repository.itemResourceExists(S("a.zlw"), S("r.csv"), resource));
    ASSERT_EQ(numberOf(error), msg::kServerError);
    EXPECT_EQ(error->getCode(), 2u);
    EXPECT_EQ(resource, 0u);
    EXPECT_TRUE(server.verify());
}

TEST_F(RepositoryTest, UploadsAndDownloadsTurnCrcCheckingOffAndReportProgress)
{
    const std::string item = "workspace bytes\n";
    const std::string resource = "0123456789";
    const std::string destination = (dir / "down.csv").string();
    expectUpload(repoCommand("REP_ADD_ITEM", {{"itemName", "roads.zlw"}, {"itemFileCRCCheckingEnabled", "false"}}),
                 item);
    expectUpload(repoCommand("REP_UPDATE_ITEMRESOURCE", {{"itemName", "roads.zlw"},
                                                         {"resourceName", "codes.csv"},
                                                         {"resourceFileCRCCheckingEnabled", "false"}}),
                 resource);
    expectUpload(
        repoCommand("REP_ADD_ITEMRESOURCE",
                    {{"itemName", "a.zlw"}, {"resourceName", "up.csv"}, {"resourceFileCRCCheckingEnabled", "false"}}),
        resource);
    // updateItem deliberately sends an item name that addItem refuses.
    expectUpload(
        repoCommand("REP_UPDATE_ITEM", {{"itemName", "dir/roads.zlw"}, {"itemFileCRCCheckingEnabled", "false"}}), item);
    // The resource is read back straight into its destination.
    expectDownload(
        repoCommand("REP_GET_ITEMRESOURCE",
                    {{"itemName", "a.zlw"}, {"resourceName", "up.csv"}, {"resourceFileCRCCheckingEnabled", "false"}}),
        resource, success("true"));
    signIn();
    const std::string itemFile = file("roads.zlw", item);
    EXPECT_EQ(StatusPtr(repository.addItem(S("roads.zlw"), S(itemFile))), nullptr);
    const std::string source = file("up.csv", resource);
    EXPECT_EQ(StatusPtr(repository.updateItemResource(S("roads.zlw"), S("codes.csv"), S(source))), nullptr);
    ProgressLog up;
    EXPECT_EQ(StatusPtr(repository.addItemResource(S("a.zlw"), S("up.csv"), S(source), &up)), nullptr);
    EXPECT_EQ(up.calls, (std::vector<std::string>{"total 10", "start", "at 0", "finish"}));
    EXPECT_EQ(numberOf(StatusPtr(repository.addItem(S("dir/roads.zlw"), S(itemFile)))), msg::kForbiddenCharacter);
    const StatusPtr slash(repository.updateItem(S("dir/roads.zlw"), S(itemFile)));
    EXPECT_EQ(slash, nullptr) << describe(slash.get());
    ProgressLog down;
    unsigned received = 7;
    EXPECT_EQ(StatusPtr(repository.getItemResource(S("a.zlw"), S("up.csv"), S(destination), received, &down)), nullptr);
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(down.calls, (std::vector<std::string>{"total 10", "start", "at 0", "finish"}));
    EXPECT_EQ(slurp(destination), resource);
    EXPECT_TRUE(server.verify());
}

TEST_F(RepositoryTest, LocalChecksAndFileProblemsAreReportedBeforeAnythingIsSent)
{
    signIn();
    const std::string missing = (dir / "missing.zlw").string();
    const StatusPtr upload(repository.updateItem(S("roads.zlw"), S(missing)));
    ASSERT_EQ(numberOf(upload), msg::kLocalFileRead);
    EXPECT_NE(std::string(upload->getMessage()).find(missing), std::string::npos) << upload->getMessage();

    const std::string destination = (dir / "missing" / "codes.csv").string();
    unsigned received = 7;
    const StatusPtr download(repository.getItemResource(S("roads.zlw"), S("codes.csv"), S(destination), received));
    ASSERT_EQ(numberOf(download), msg::kLocalFileWrite);
    EXPECT_NE(std::string(download->getMessage()).find(destination), std::string::npos) << download->getMessage();
    EXPECT_EQ(received, 0u);

    // A resource named like its item is refused before the file is opened; the character check comes
    // first, and names that differ only in case are different names.
    const ZELServerString noFile = S(missing);
    EXPECT_EQ(numberOf(StatusPtr(repository.addItemResource(S("a.zlw"), S("a.zlw"), noFile))),
              msg::kResourceNamedAsItem);
    EXPECT_EQ(numberOf(StatusPtr(repository.updateItemResource(S("a.zlw"), S("a.zlw"), noFile))),
              msg::kResourceNamedAsItem);
    EXPECT_EQ(numberOf(StatusPtr(repository.addItemResource(S("a%"), S("a%"), noFile))), msg::kForbiddenCharacter);
    EXPECT_EQ(numberOf(StatusPtr(repository.addItemResource(S("a.zlw"), S("A.zlw"), noFile))), msg::kLocalFileRead);
    EXPECT_TRUE(server.verify());
}

// ---- Argument checks --------------------------------------------------------------------------------

struct Call {
    const char* operation;
    bool takesResource;
    bool takesPath;
    std::function<IZELServerStatus*(IZELServerRepository&, const ZELServerString& item, const ZELServerString& resource,
                                    const ZELServerString& path)>
        call;
};

// Every operation that takes an item name (and possibly a resource name and a path).
std::vector<Call> itemOperations()
{
    static unsigned flag = 0;
    return {
        {"itemExists", false, false, [](auto& r, auto& i, auto&, auto&) { return r.itemExists(i, flag); }},
        {"getItem", false, true, [](auto& r, auto& i, auto&, auto& p) { return r.getItem(i, p, flag); }},
        {"addItem", false, true, [](auto& r, auto& i, auto&, auto& p) { return r.addItem(i, p); }},
        {"updateItem", false, true, [](auto& r, auto& i, auto&, auto& p) { return r.updateItem(i, p); }},
        {"removeItem", false, false, [](auto& r, auto& i, auto&, auto&) { return r.removeItem(i, flag); }},
        {"itemResourceExists", true, false,
         [](auto& r, auto& i, auto& n, auto&) { return r.itemResourceExists(i, n, flag); }},
        {"getItemResource", true, true,
         [](auto& r, auto& i, auto& n, auto& p) { return r.getItemResource(i, n, p, flag); }},
        {"addItemResource", true, true, [](auto& r, auto& i, auto& n, auto& p) { return r.addItemResource(i, n, p); }},
        {"updateItemResource", true, true,
         [](auto& r, auto& i, auto& n, auto& p) { return r.updateItemResource(i, n, p); }},
        {"removeItemResource", true, false,
         [](auto& r, auto& i, auto& n, auto&) { return r.removeItemResource(i, n, flag); }},
    };
}

TEST_F(RepositoryTest, EmptyOrForbiddenNamesAreRefusedBeforeAnythingIsSent)
{
    signIn();
    const ZELServerString path = S(file("src", "x"));
    for (const Call& c : itemOperations()) {
        SCOPED_TRACE(c.operation);
        EXPECT_EQ(numberOf(StatusPtr(c.call(repository, S(""), S("r.csv"), path))), msg::kRequiredValueMissing);
        if (c.takesResource) {
            EXPECT_EQ(numberOf(StatusPtr(c.call(repository, S("a.zlw"), S(""), path))), msg::kRequiredValueMissing);
        }
        if (c.takesPath) {
            EXPECT_EQ(numberOf(StatusPtr(c.call(repository, S("a.zlw"), S("r.csv"), S("")))),
                      msg::kRequiredValueMissing);
        }
        // An empty name wins over a forbidden character in the other name.
        EXPECT_EQ(numberOf(StatusPtr(c.call(repository, S(""), S("r/1"), path))), msg::kRequiredValueMissing);
        // updateItem deliberately lets any item name through.
        const std::string forbiddenHere = std::string(c.operation) == "updateItem" ? "" : kForbidden;
        for (const char forbidden : forbiddenHere) {
            const std::string bad = "a"s + forbidden + "b";
            const StatusPtr badItem(c.call(repository, S(bad), S("r.csv"), path));
            ASSERT_EQ(numberOf(badItem), msg::kForbiddenCharacter) << "item " << bad;
            EXPECT_NE(std::string(badItem->getMessage()).find(kForbidden), std::string::npos) << badItem->getMessage();
            if (c.takesResource) {
                EXPECT_EQ(numberOf(StatusPtr(c.call(repository, S("a.zlw"), S(bad), path))), msg::kForbiddenCharacter)
                    << "resource " << bad;
            }
        }
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(RepositoryTest, ViewsAndRegistrationsCheckOnlyForEmptinessWithTheirOwnExceptions)
{
    server
        .exchange(repoCommand("REP_WORKSPACESERVICEEXISTS", {{"workspaceName", "a/b"}, {"serviceName", "c:d"}}),
                  success("false"))
        .exchange(repoCommand("REP_GET_TEMPLATEVIEW", {{"templateName", "t*"}}), success("<R/>"))
        .exchange(repoCommand("REP_GET_ITEMRESOURCESVIEW", {{"itemName", ""}, {"enableFilter", "All"}}),
                  success("<R/>"))
        .exchange(repoCommand("REP_GET_ITEMRESOURCEVIEW", {{"itemName", "a.zlw"}, {"resourceName", ""}}),
                  success("<R/>"));
    signIn();
    unsigned flag = 7;
    EXPECT_EQ(StatusPtr(repository.workspaceServiceExists(S("a/b"), S("c:d"), flag)), nullptr);
    EXPECT_EQ(flag, 0u);
    ZELServerTemplate templ;
    unsigned found = 7;
    EXPECT_EQ(StatusPtr(repository.getTemplateView(S("t*"), templ, found)), nullptr);
    EXPECT_EQ(found, 0u);
    // The item resource views let an empty item or resource name through.
    ZELServerVector<IZELServerResource, ZELServerResource> resources;
    EXPECT_EQ(StatusPtr(repository.getItemResourcesView(S(""), nullptr, resources)), nullptr);
    ZELServerResource resource;
    found = 7;
    EXPECT_EQ(StatusPtr(repository.getItemResourceView(S("a.zlw"), S(""), resource, found)), nullptr);
    EXPECT_EQ(found, 0u);

    ZELServerWorkspace workspace(nullptr);
    const std::vector<std::pair<const char*, IZELServerStatus*>> refused = {
        {"registerWorkspaceService", repository.registerWorkspaceService(S(""), S("svc"))},
        {"deregisterWorkspaceService", repository.deregisterWorkspaceService(S("w"), S(""), flag)},
        {"getWorkspaceView", repository.getWorkspaceView(S(""), workspace, found)},
        {"getItemResourceView", repository.getItemResourceView(S(""), S("r.csv"), resource, found)},
    };
    for (const auto& [operation, raw] : refused) {
        EXPECT_EQ(numberOf(StatusPtr(raw)), msg::kRequiredValueMissing) << operation;
    }
    EXPECT_TRUE(server.verify());
}

// ---- Item downloads ---------------------------------------------------------------------------------

TEST_F(RepositoryTest, ItemDestinationIsReplacedOnlyByACompleteFileAndNoTemporaryFileStays)
{
    // The system's temporary folder points into the test's folder, so that leftovers can be seen.
    const fs::path temporary = dir / "tmp";
    fs::create_directory(temporary);
    const zeltest::ScopedTemporaryFolder redirected(temporary);
    const Bytes getItem =
        repoCommand("REP_GET_ITEM", {{"itemName", "roads.zlw"}, {"itemFileCRCCheckingEnabled", "false"}});
    const std::string big(200000, 'w');
    expectDownload(getItem, big, success("true"));
    server.exchange(getItem, success("false"));
    expectDownload(getItem, "", success("true"));
    expectDownload(getItem, "new contents", zeltest::reply("ERROR", "item is locked"));
    signIn();

    struct Case {
        const char* what;
        std::string destination;  // relative to the test's folder; made with the old contents unless missing
        unsigned number;
        std::optional<unsigned> received;
        std::string after;  // the destination's contents afterwards
        std::string named;  // text the status message must contain
    };
    const std::string old = "old contents";
    const Case cases[] = {
        {"complete file", "a.zlw", 0, 1, big, ""},
        {"no file", "b.zlw", msg::kEmptyDownload, 0, old, "roads.zlw"},
        {"zero bytes", "c.zlw", msg::kEmptyDownload, 0, old, "roads.zlw"},
        {"error after the whole file", "d.zlw", msg::kServerError, 0, old, ""},
        // The temporary file goes beside the destination, so nothing is sent.
        {"missing folder", "no-such-dir/e.zlw", msg::kLocalFileWrite, 0, "", (dir / "no-such-dir/e.zlw").string()},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        const std::string destination = (dir / c.destination).string();
        if (c.number != msg::kLocalFileWrite) {
            file(c.destination, old);
        }
        unsigned received = 7;
        const StatusPtr status(repository.getItem(S("roads.zlw"), S(destination), received));
        ASSERT_EQ(numberOf(status), c.number) << describe(status.get());
        if (c.received) {
            EXPECT_EQ(received, *c.received);
        }
        EXPECT_EQ(slurp(destination), c.after);
        if (!c.named.empty()) {
            EXPECT_NE(std::string(status->getMessage()).find(c.named), std::string::npos) << status->getMessage();
        }
        EXPECT_TRUE(fs::is_empty(temporary));
    }
    EXPECT_TRUE(server.verify());
}

// ---- View filters -----------------------------------------------------------------------------------

TEST_F(RepositoryTest, WorkspaceFiltersTranslateTheThreeValuesExactlyAndRefuseAnythingElse)
{
    const std::vector<std::pair<std::optional<std::string>, std::string>> sent = {
        {std::nullopt, "All"}, {"ALL", "All"}, {"ENABLED", "Enabled"}, {"DISABLED", "Disabled"}};
    for (const auto& [filter, value] : sent) {
        server.exchange(repoCommand("REP_GET_WORKSPACESUMMARIESVIEW", {{"enableFilter", value}}),
                        success(R"(<R><WORKSPACE_SUMMARY name="s1"/><WORKSPACE_SUMMARY name="s2"/></R>)"));
    }
    signIn();
    ZELServerVector<IZELServerWorkspaceSummary, ZELServerWorkspaceSummary> summaries;
    for (const auto& [filter, value] : sent) {
        ZELServerStringDict directives;
        if (filter) {
            directives.insert("ENABLE_FILTER", *filter);
        }
        EXPECT_EQ(StatusPtr(repository.getWorkspaceSummariesView(filter ? &directives : nullptr, summaries)), nullptr);
        EXPECT_EQ(summaries.entries(), 2u) << value;
    }
    for (const char* filter : {static_cast<const char*>(nullptr), "enabled", "All", "ENABLED ", ""}) {
        ZELServerStringDict directives;
        directives.insert("OTHER", "x");
        if (filter) {
            directives.insert("ENABLE_FILTER", filter);
        }
        ZELServerVector<IZELServerWorkspace, ZELServerWorkspace> workspaces;
        EXPECT_EQ(numberOf(StatusPtr(repository.getWorkspacesView(&directives, workspaces))),
                  msg::kRequiredValueMissing)
            << (filter ? filter : "(missing)");
        EXPECT_EQ(numberOf(StatusPtr(repository.getWorkspaceSummariesView(&directives, summaries))),
                  msg::kRequiredValueMissing)
            << (filter ? filter : "(missing)");
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(RepositoryTest, ListViewsIgnoreTheirDirectivesAndAskForEverything)
{
    server
        .exchange(repoCommand("REP_GET_CUSTOMFORMATSVIEW", {{"enableFilter", "All"}}),
                  success(R"(<R><CUSTOMFORMAT name="f.zds"/></R>)"))
        .exchange(repoCommand("REP_GET_CUSTOMTRANSFORMERSVIEW", {{"enableFilter", "All"}}),
                  success(R"(<R><CUSTOMTRANSFORMER name="t1.zlx"/><CUSTOMTRANSFORMER name="t2.zlx"/></R>)"))
        .exchange(repoCommand("REP_GET_TEMPLATESVIEW", {{"enableFilter", "All"}}),
                  success(R"(<R><TEMPLATE name="p"/></R>)"))
        .exchange(repoCommand("REP_GET_ITEMRESOURCESVIEW", {{"itemName", "a.zlw"}, {"enableFilter", "All"}}),
                  success(R"(<R><RESOURCE name="r1"/><RESOURCE name="r2"/><RESOURCE name="r3"/></R>)"));
    signIn();
    ZELServerStringDict directives;
    directives.insert("ENABLE_FILTER", "DISABLED");
    ZELServerVector<IZELServerCustomFormat, ZELServerCustomFormat> formats;
    ZELServerVector<IZELServerCustomTransformer, ZELServerCustomTransformer> transformers;
    ZELServerVector<IZELServerTemplate, ZELServerTemplate> templates;
    ZELServerVector<IZELServerResource, ZELServerResource> resources;
    EXPECT_EQ(StatusPtr(repository.getCustomFormatsView(&directives, formats)), nullptr);
    EXPECT_EQ(StatusPtr(repository.getCustomTransformersView(&directives, transformers)), nullptr);
    EXPECT_EQ(StatusPtr(repository.getTemplatesView(&directives, templates)), nullptr);
    EXPECT_EQ(StatusPtr(repository.getItemResourcesView(S("a.zlw"), &directives, resources)), nullptr);
    EXPECT_EQ(
        (std::vector<unsigned>{formats.entries(), transformers.entries(), templates.entries(), resources.entries()}),
        (std::vector<unsigned>{1, 2, 1, 3}));
    EXPECT_TRUE(server.verify());
}

TEST_F(RepositoryTest, SingleViewsFillTheCallersObjectAndSetFound)
{
    server
        .exchange(repoCommand("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}),
                  success(R"(<R><WORKSPACE_DEFINITIONS workspace_id="w1" name="roads.zlw">)"
                          R"(<DATASET name="A" is_source="true"/></WORKSPACE_DEFINITIONS></R>)"))
        .exchange(repoCommand("REP_GET_CUSTOMFORMATVIEW", {{"customFormatName", "f.zds"}}),
                  success(R"(<R><CUSTOMFORMAT name="f.zds" filesize="12"/></R>)"))
        .exchange(repoCommand("REP_GET_CUSTOMTRANSFORMERVIEW", {{"customTransformerName", "t.zlx"}}),
                  success(R"(<R><CUSTOMTRANSFORMER name="t.zlx"/></R>)"))
        .exchange(repoCommand("REP_GET_ITEMRESOURCEVIEW", {{"itemName", "a.zlw"}, {"resourceName", "r.csv"}}),
                  success(R"(<R><RESOURCE name="r.csv" filesize="5"/></R>)"));
    signIn();
    ZELServerWorkspace workspace(nullptr);
    ZELServerCustomFormat format;
    ZELServerCustomTransformer transformer;
    ZELServerResource resource;
    unsigned found[4] = {7, 7, 7, 7};
    EXPECT_EQ(StatusPtr(repository.getWorkspaceView(S("roads.zlw"), workspace, found[0])), nullptr);
    EXPECT_EQ(StatusPtr(repository.getCustomFormatView(S("f.zds"), format, found[1])), nullptr);
    EXPECT_EQ(StatusPtr(repository.getCustomTransformerView(S("t.zlx"), transformer, found[2])), nullptr);
    EXPECT_EQ(StatusPtr(repository.getItemResourceView(S("a.zlw"), S("r.csv"), resource, found[3])), nullptr);
    EXPECT_EQ(std::vector<unsigned>(found, found + 4), (std::vector<unsigned>{1, 1, 1, 1}));
    EXPECT_EQ(workspace.getSourceDatasets().entries(), 1u);
    EXPECT_EQ(format.getFileSize(), 12);
    EXPECT_EQ(resource.getFileSize(), 5);
    EXPECT_TRUE(server.verify());
}

// ---- Workspace registrations ------------------------------------------------------------------------

TEST_F(RepositoryTest, WorkspaceServicesFilterAppendsTheWorkspaceNameAndRegistrationsNameBoth)
{
    const zeltest::Values names = {{"workspaceName", "roads.zlw"}, {"serviceName", "download"}};
    server
        .exchange(repoCommand("REP_GET_WORKSPACESERVICES", {{"enableFilter", "All"}, {"workspaceName", "roads.zlw"}}),
                  success(R"(<R><WORKSPACE_SERVICE><WORKSPACE_SUMMARY name="roads.zlw" is_enabled="true"/>)"
                          R"(<SERVICE service_id="3" name="download" is_workspace_reg_allowed="true"/>)"
                          R"(</WORKSPACE_SERVICE></R>)"))
        .exchange(repoCommand("REP_GET_WORKSPACESERVICES", {{"enableFilter", "Disabled"}, {"workspaceName", "w"}}),
                  success("<R/>"))
        .exchange(repoCommand("REP_GET_WORKSPACESERVICES", {{"enableFilter", "All"}}), success("<R/>"))
        .exchange(repoCommand("REP_REGISTER_WORKSPACESERVICE", names), success("true"))
        .exchange(repoCommand("REP_DEREGISTER_WORKSPACESERVICE", names), success("true"));
    signIn();
    ZELServerStringDict onlyWorkspace;
    onlyWorkspace.insert("WORKSPACE_NAME", "roads.zlw");
    ZELServerVector<IZELServerWorkspaceService, ZELServerWorkspaceService> registrations;
    EXPECT_EQ(StatusPtr(repository.getWorkspaceServices(&onlyWorkspace, registrations)), nullptr);
    ASSERT_EQ(registrations.entries(), 1u);
    ZELServerString name;
    registrations.element(0)->getWorkspaceSummary().getName(name);
    EXPECT_EQ(name.str(), "roads.zlw");
    EXPECT_TRUE(registrations.element(0)->getWorkspaceSummary().isEnabled());
    registrations.element(0)->getService().getName(name);
    EXPECT_EQ(name.str(), "download");
    EXPECT_EQ(registrations.element(0)->getService().isWorkspaceRegistrationAllowed(), 1u);

    ZELServerStringDict disabled;
    disabled.insert("ENABLE_FILTER", "DISABLED");
    disabled.insert("WORKSPACE_NAME", "w");
    EXPECT_EQ(StatusPtr(repository.getWorkspaceServices(&disabled, registrations)), nullptr);
    EXPECT_EQ(registrations.entries(), 0u);
    EXPECT_EQ(StatusPtr(repository.getWorkspaceServices(nullptr, registrations)), nullptr);

    ZELServerStringDict unknown;
    unknown.insert("ENABLE_FILTER", "Enabled");
    EXPECT_EQ(numberOf(StatusPtr(repository.getWorkspaceServices(&unknown, registrations))),
              msg::kRequiredValueMissing);
    EXPECT_EQ(StatusPtr(repository.registerWorkspaceService(S("roads.zlw"), S("download"))), nullptr);
    unsigned deregistered = 0;
    EXPECT_EQ(StatusPtr(repository.deregisterWorkspaceService(S("roads.zlw"), S("download"), deregistered)), nullptr);
    EXPECT_EQ(deregistered, 1u);
    EXPECT_TRUE(server.verify());
}

TEST(RepositoryObject, WithoutAChannelCommandsFailAfterTheirChecks)
{
    ZELServerRepository repository(nullptr);
    unsigned exists = 7;
    EXPECT_EQ(numberOf(StatusPtr(repository.itemExists(S(""), exists))), msg::kRequiredValueMissing);
    EXPECT_EQ(numberOf(StatusPtr(repository.itemExists(S("a.zlw"), exists))), msg::kNotConnected);
    EXPECT_EQ(exists, 0u);
    ZELServerString name("stale");
    repository.getName(name);
    EXPECT_EQ(name.str(), "");
}

}  // namespace
}  // namespace zel::repotest
