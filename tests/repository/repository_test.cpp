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

ZELServerString S(const std::string& text) { return ZELServerString(text); }

const std::string kForbidden = "\\/:*?\"<>|&='+%";

class RepositoryTest : public RepositoryWireTest {
protected:
    ZELServerRepository repository{channel.get(), S("Samples"), S("sample workspaces")};
};

// ---- Items ------------------------------------------------------------------------------------------

TEST_F(RepositoryTest, ItemExistsAsksWithTheRepositoryNameFirst)
{
    server.exchange(command("REP_ITEMEXISTS", {{"repositoryName", "Samples"}, {"itemName", "roads.zlw"}}),
                    success("true"));
    connect();
    unsigned exists = 7;
    const StatusPtr status(repository.itemExists(S("roads.zlw"), exists));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(exists, 1u);
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, AnswerThatIsNoTruthValueLeavesTheFlagAtZeroAndSucceeds)
{
    server.exchange(command("REP_REMOVE_ITEM", {{"repositoryName", "Samples"}, {"itemName", "a.zlw"}}),
                    success("True"));
    connect();
    unsigned removed = 7;
    const StatusPtr status(repository.removeItem(S("a.zlw"), removed));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(removed, 0u);
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, ServerErrorComesBackUnchangedWithTheFlagAtZero)
{
    server.exchange(command("REP_ITEMRESOURCEEXISTS",
                            {{"repositoryName", "Samples"}, {"itemName", "a.zlw"}, {"resourceName", "r.csv"}}),
                    zeltest::reply("ERROR", "Authorization Error: no rights"));
    connect();
    unsigned exists = 7;
    const StatusPtr status(repository.itemResourceExists(S("a.zlw"), S("r.csv"), exists));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(status->getCode(), 2u);
    EXPECT_EQ(exists, 0u);
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, AddItemUploadsTheFileWithCrcCheckingOff)
{
    const std::string content = "workspace bytes\n";
    const std::string path = file("roads.zlw", content);
    server.expectFrame(command("REP_ADD_ITEM", {{"repositoryName", "Samples"},
                                                {"itemName", "roads.zlw"},
                                                {"itemFileCRCCheckingEnabled", "false"}}))
        .sendFrame(zeltest::readyAck())
        .expectFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .sendFrame(zeltest::readyAck())
        .expectRawBytes(content)
        .sendFrame(success("true"));
    connect();
    const StatusPtr status(repository.addItem(S("roads.zlw"), S(path)));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, UpdateItemResourceUploadsWithResourceCrcCheckingOff)
{
    const std::string content = "a,b\n1,2\n";
    const std::string path = file("codes.csv", content);
    server.expectFrame(command("REP_UPDATE_ITEMRESOURCE", {{"repositoryName", "Samples"},
                                                           {"itemName", "roads.zlw"},
                                                           {"resourceName", "codes.csv"},
                                                           {"resourceFileCRCCheckingEnabled", "false"}}))
        .sendFrame(zeltest::readyAck())
        .expectFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .sendFrame(zeltest::readyAck())
        .expectRawBytes(content)
        .sendFrame(success("true"));
    connect();
    const StatusPtr status(repository.updateItemResource(S("roads.zlw"), S("codes.csv"), S(path)));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, UploadOfAFileThatCannotBeOpenedNamesItAndSendsNothing)
{
    connect();
    const std::string missing = (dir / "missing.zlw").string();
    const StatusPtr status(repository.updateItem(S("roads.zlw"), S(missing)));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kLocalFileRead);
    EXPECT_NE(std::string(status->getMessage()).find(missing), std::string::npos) << status->getMessage();
    EXPECT_TRUE(sentCommands(0));
}

// Records the progress calls in order.
class ProgressLog final : public IZELServerProgressListener {
public:
    void totalSize(unsigned bytes) override { calls.push_back("total " + std::to_string(bytes)); }
    void start() override { calls.push_back("start"); }
    void position(unsigned bytes) override { calls.push_back("at " + std::to_string(bytes)); }
    void finish() override { calls.push_back("finish"); }
    std::vector<std::string> calls;
};

TEST_F(RepositoryTest, TransfersReportToTheCallersListener)
{
    const std::string content = "0123456789";
    const std::string source = file("up.csv", content);
    const std::string destination = (dir / "down.csv").string();
    server.expectFrame(command("REP_ADD_ITEMRESOURCE", {{"repositoryName", "Samples"},
                                                        {"itemName", "a.zlw"},
                                                        {"resourceName", "up.csv"},
                                                        {"resourceFileCRCCheckingEnabled", "false"}}))
        .sendFrame(zeltest::readyAck())
        .expectFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .sendFrame(zeltest::readyAck())
        .expectRawBytes(content)
        .sendFrame(success("true"))
        .expectFrame(command("REP_GET_ITEMRESOURCE", {{"repositoryName", "Samples"},
                                                      {"itemName", "a.zlw"},
                                                      {"resourceName", "up.csv"},
                                                      {"resourceFileCRCCheckingEnabled", "false"}}))
        .sendFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .expectFrame(zeltest::readyAck())
        .sendRaw(content)
        .expectFrame(zeltest::readyAck())
        .sendFrame(success("true"));
    connect();
    ProgressLog up;
    EXPECT_EQ(StatusPtr(repository.addItemResource(S("a.zlw"), S("up.csv"), S(source), &up)), nullptr);
    EXPECT_EQ(up.calls, (std::vector<std::string>{"total 10", "start", "at 0", "finish"}));
    ProgressLog down;
    unsigned received = 0;
    EXPECT_EQ(StatusPtr(repository.getItemResource(S("a.zlw"), S("up.csv"), S(destination), received, &down)), nullptr);
    EXPECT_EQ(down.calls, (std::vector<std::string>{"total 10", "start", "at 0", "finish"}));
    EXPECT_EQ(slurp(destination), content);
    EXPECT_TRUE(sentCommands(2));
}

// ---- Argument checks --------------------------------------------------------------------------------

struct Call {
    const char* operation;
    bool takesResource;
    bool takesPath;
    std::function<IZELServerStatus*(IZELServerRepository&, const ZELServerString& item,
                                    const ZELServerString& resource, const ZELServerString& path)>
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

TEST_F(RepositoryTest, EmptyItemResourceOrPathIsRefusedBeforeAnythingIsSent)
{
    connect();
    const std::string path = file("src", "x");
    for (const Call& c : itemOperations()) {
        const StatusPtr noItem(c.call(repository, S(""), S("r.csv"), S(path)));
        EXPECT_EQ(numberOf(noItem), msg::kRequiredValueMissing) << c.operation;
        if (c.takesResource) {
            const StatusPtr noResource(c.call(repository, S("a.zlw"), S(""), S(path)));
            EXPECT_EQ(numberOf(noResource), msg::kRequiredValueMissing) << c.operation;
        }
        if (c.takesPath) {
            const StatusPtr noPath(c.call(repository, S("a.zlw"), S("r.csv"), S("")));
            EXPECT_EQ(numberOf(noPath), msg::kRequiredValueMissing) << c.operation;
        }
        // An empty name wins over a forbidden character in the other name.
        const StatusPtr emptyFirst(c.call(repository, S(""), S("r/1"), S(path)));
        EXPECT_EQ(numberOf(emptyFirst), msg::kRequiredValueMissing) << c.operation;
    }
    EXPECT_TRUE(sentCommands(0));
}

TEST_F(RepositoryTest, ForbiddenCharactersAreRefusedEverywhereButUpdateItem)
{
    connect();
    const std::string path = file("src", "x");
    for (const Call& c : itemOperations()) {
        if (std::string(c.operation) == "updateItem") {
            continue;
        }
        for (const char forbidden : kForbidden) {
            const std::string bad = "a"s + forbidden + "b";
            const StatusPtr badItem(c.call(repository, S(bad), S("r.csv"), S(path)));
            ASSERT_EQ(numberOf(badItem), msg::kForbiddenCharacter) << c.operation << " item " << bad;
            EXPECT_NE(std::string(badItem->getMessage()).find(kForbidden), std::string::npos) << badItem->getMessage();
            if (c.takesResource) {
                const StatusPtr badResource(c.call(repository, S("a.zlw"), S(bad), S(path)));
                EXPECT_EQ(numberOf(badResource), msg::kForbiddenCharacter) << c.operation << " resource " << bad;
            }
        }
    }
    EXPECT_TRUE(sentCommands(0));
}

TEST_F(RepositoryTest, UpdateItemSendsANameWithASlashThatAddItemRefuses)
{
    const std::string content = "z";
    const std::string path = file("src", content);
    server.expectFrame(command("REP_UPDATE_ITEM", {{"repositoryName", "Samples"},
                                                   {"itemName", "dir/roads.zlw"},
                                                   {"itemFileCRCCheckingEnabled", "false"}}))
        .sendFrame(zeltest::readyAck())
        .expectFrame(zeltest::fileHeader(1, zeltest::crc32(content)))
        .sendFrame(zeltest::readyAck())
        .expectRawBytes(content)
        .sendFrame(success("true"));
    connect();
    const StatusPtr refused(repository.addItem(S("dir/roads.zlw"), S(path)));
    EXPECT_EQ(numberOf(refused), msg::kForbiddenCharacter);
    const StatusPtr sent(repository.updateItem(S("dir/roads.zlw"), S(path)));
    EXPECT_EQ(sent, nullptr) << describe(sent.get());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, ResourceNamedLikeItsItemIsRefusedBeforeTheFileIsOpened)
{
    connect();
    const std::string missing = (dir / "missing").string();
    const StatusPtr added(repository.addItemResource(S("a.zlw"), S("a.zlw"), S(missing)));
    EXPECT_EQ(numberOf(added), msg::kResourceNamedAsItem);
    const StatusPtr updated(repository.updateItemResource(S("a.zlw"), S("a.zlw"), S(missing)));
    EXPECT_EQ(numberOf(updated), msg::kResourceNamedAsItem);
    // The character check comes first; names that differ only in case are different names.
    const StatusPtr forbidden(repository.addItemResource(S("a%"), S("a%"), S(missing)));
    EXPECT_EQ(numberOf(forbidden), msg::kForbiddenCharacter);
    const StatusPtr caseDiffers(repository.addItemResource(S("a.zlw"), S("A.zlw"), S(missing)));
    EXPECT_EQ(numberOf(caseDiffers), msg::kLocalFileRead);
    EXPECT_TRUE(sentCommands(0));
}

TEST_F(RepositoryTest, ViewsAndRegistrationsCheckOnlyForEmptiness)
{
    server.exchange(command("REP_WORKSPACESERVICEEXISTS",
                            {{"repositoryName", "Samples"}, {"workspaceName", "a/b"}, {"serviceName", "c:d"}}),
                    success("false"))
        .exchange(command("REP_GET_TEMPLATEVIEW", {{"repositoryName", "Samples"}, {"templateName", "t*"}}),
                  success("<R/>"));
    connect();
    unsigned flag = 7;
    const StatusPtr exists(repository.workspaceServiceExists(S("a/b"), S("c:d"), flag));
    EXPECT_EQ(exists, nullptr) << describe(exists.get());
    EXPECT_EQ(flag, 0u);
    ZELServerTemplate templ;
    unsigned found = 7;
    const StatusPtr view(repository.getTemplateView(S("t*"), templ, found));
    EXPECT_EQ(view, nullptr) << describe(view.get());
    EXPECT_EQ(found, 0u);

    const StatusPtr noWorkspace(repository.registerWorkspaceService(S(""), S("svc")));
    EXPECT_EQ(numberOf(noWorkspace), msg::kRequiredValueMissing);
    const StatusPtr noService(repository.deregisterWorkspaceService(S("w"), S(""), flag));
    EXPECT_EQ(numberOf(noService), msg::kRequiredValueMissing);
    ZELServerWorkspace workspace(nullptr);
    const StatusPtr noName(repository.getWorkspaceView(S(""), workspace, found));
    EXPECT_EQ(numberOf(noName), msg::kRequiredValueMissing);
    EXPECT_TRUE(sentCommands(2));
}

TEST_F(RepositoryTest, ItemResourceViewsHaveTheirOwnExceptions)
{
    server.exchange(command("REP_GET_ITEMRESOURCESVIEW",
                            {{"repositoryName", "Samples"}, {"itemName", ""}, {"enableFilter", "All"}}),
                    success("<R/>"))
        .exchange(command("REP_GET_ITEMRESOURCEVIEW",
                          {{"repositoryName", "Samples"}, {"itemName", "a.zlw"}, {"resourceName", ""}}),
                  success("<R/>"));
    connect();
    ZELServerVector<IZELServerResource, ZELServerResource> resources;
    const StatusPtr list(repository.getItemResourcesView(S(""), nullptr, resources));
    EXPECT_EQ(list, nullptr) << describe(list.get());
    ZELServerResource resource;
    unsigned found = 7;
    const StatusPtr single(repository.getItemResourceView(S("a.zlw"), S(""), resource, found));
    EXPECT_EQ(single, nullptr) << describe(single.get());
    EXPECT_EQ(found, 0u);
    const StatusPtr noItem(repository.getItemResourceView(S(""), S("r.csv"), resource, found));
    EXPECT_EQ(numberOf(noItem), msg::kRequiredValueMissing);
    EXPECT_TRUE(sentCommands(2));
}

// ---- Downloads --------------------------------------------------------------------------------------

// Points the system's temporary directory at a folder of the test, so that leftovers can be seen.
class ItemDownloadTest : public RepositoryTest {
protected:
    void SetUp() override
    {
        RepositoryTest::SetUp();
        temporary = dir / "tmp";
        fs::create_directory(temporary);
        redirected.emplace(temporary);
    }
    bool temporaryIsEmpty() const { return fs::is_empty(temporary); }

    Bytes getItem(const std::string& item)
    {
        return command("REP_GET_ITEM",
                       {{"repositoryName", "Samples"}, {"itemName", item}, {"itemFileCRCCheckingEnabled", "false"}});
    }

    fs::path temporary;
    std::optional<zeltest::ScopedTemporaryFolder> redirected;
};

TEST_F(ItemDownloadTest, ReceivedItemReplacesTheDestination)
{
    const std::string content(200000, 'w');
    const std::string destination = file("roads.zlw", "old contents");
    server.expectFrame(getItem("roads.zlw"))
        .sendFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .expectFrame(zeltest::readyAck())
        .sendRaw(content)
        .expectFrame(zeltest::readyAck())
        .sendFrame(success("true"));
    connect();
    unsigned received = 7;
    const StatusPtr status(repository.getItem(S("roads.zlw"), S(destination), received));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(slurp(destination), content);
    EXPECT_TRUE(temporaryIsEmpty());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(ItemDownloadTest, NoFileFromTheServerKeepsTheOldDestinationAndNamesTheItem)
{
    const std::string destination = file("roads.zlw", "old contents");
    server.expectFrame(getItem("roads.zlw")).sendFrame(success("false"));
    connect();
    unsigned received = 7;
    const StatusPtr status(repository.getItem(S("roads.zlw"), S(destination), received));
    ASSERT_EQ(numberOf(status), msg::kEmptyDownload);
    EXPECT_NE(std::string(status->getMessage()).find("roads.zlw"), std::string::npos) << status->getMessage();
    EXPECT_EQ(received, 0u);
    EXPECT_EQ(slurp(destination), "old contents");
    EXPECT_TRUE(temporaryIsEmpty());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(ItemDownloadTest, ZeroByteFileIsAnEmptyDownloadToo)
{
    const std::string destination = file("roads.zlw", "old contents");
    server.expectFrame(getItem("roads.zlw"))
        .sendFrame(zeltest::fileHeader(0, 0))
        .expectFrame(zeltest::readyAck())
        .expectFrame(zeltest::readyAck())
        .sendFrame(success("true"));
    connect();
    unsigned received = 7;
    const StatusPtr status(repository.getItem(S("roads.zlw"), S(destination), received));
    EXPECT_EQ(numberOf(status), msg::kEmptyDownload);
    // The answer was read before the size was looked at.
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(slurp(destination), "old contents");
    EXPECT_TRUE(temporaryIsEmpty());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(ItemDownloadTest, FailedTransferKeepsTheDestinationAndRemovesTheTemporaryFile)
{
    const std::string destination = file("roads.zlw", "old contents");
    // The whole file arrives, but the server's final answer is an error.
    const std::string content = "new contents";
    server.expectFrame(getItem("roads.zlw"))
        .sendFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .expectFrame(zeltest::readyAck())
        .sendRaw(content)
        .expectFrame(zeltest::readyAck())
        .sendFrame(zeltest::reply("ERROR", "item is locked"));
    connect();
    unsigned received = 7;
    const StatusPtr status(repository.getItem(S("roads.zlw"), S(destination), received));
    EXPECT_EQ(numberOf(status), msg::kServerError);
    EXPECT_EQ(received, 0u);
    EXPECT_EQ(slurp(destination), "old contents");
    EXPECT_TRUE(temporaryIsEmpty());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(ItemDownloadTest, DestinationThatCannotBeWrittenIsNamed)
{
    const std::string content = "abc";
    const std::string destination = (dir / "no-such-dir" / "roads.zlw").string();
    server.expectFrame(getItem("roads.zlw"))
        .sendFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .expectFrame(zeltest::readyAck())
        .sendRaw(content)
        .expectFrame(zeltest::readyAck())
        .sendFrame(success("true"));
    connect();
    unsigned received = 0;
    const StatusPtr status(repository.getItem(S("roads.zlw"), S(destination), received));
    ASSERT_EQ(numberOf(status), msg::kLocalFileWrite);
    EXPECT_NE(std::string(status->getMessage()).find(destination), std::string::npos) << status->getMessage();
    EXPECT_TRUE(temporaryIsEmpty());
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, ResourceIsReceivedStraightIntoItsDestination)
{
    const std::string content = "code,label\n";
    const std::string destination = (dir / "codes.csv").string();
    server.expectFrame(command("REP_GET_ITEMRESOURCE", {{"repositoryName", "Samples"},
                                                        {"itemName", "roads.zlw"},
                                                        {"resourceName", "codes.csv"},
                                                        {"resourceFileCRCCheckingEnabled", "false"}}))
        .sendFrame(zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .expectFrame(zeltest::readyAck())
        .sendRaw(content)
        .expectFrame(zeltest::readyAck())
        .sendFrame(success("true"));
    connect();
    unsigned received = 7;
    const StatusPtr status(repository.getItemResource(S("roads.zlw"), S("codes.csv"), S(destination), received));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(slurp(destination), content);
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(RepositoryTest, ResourceDestinationInAMissingDirectoryIsNamedAndNothingIsSent)
{
    connect();
    const std::string destination = (dir / "missing" / "codes.csv").string();
    unsigned received = 7;
    const StatusPtr status(repository.getItemResource(S("roads.zlw"), S("codes.csv"), S(destination), received));
    ASSERT_EQ(numberOf(status), msg::kLocalFileWrite);
    EXPECT_NE(std::string(status->getMessage()).find(destination), std::string::npos) << status->getMessage();
    EXPECT_EQ(received, 0u);
    EXPECT_TRUE(sentCommands(0));
}

// ---- View filters -----------------------------------------------------------------------------------

TEST_F(RepositoryTest, SummaryFilterTranslatesTheThreeValuesExactly)
{
    const std::vector<std::pair<std::optional<std::string>, std::string>> sent = {
        {std::nullopt, "All"}, {"ALL", "All"}, {"ENABLED", "Enabled"}, {"DISABLED", "Disabled"}};
    for (const auto& [filter, value] : sent) {
        server.exchange(command("REP_GET_WORKSPACESUMMARIESVIEW", {{"repositoryName", "Samples"}, {"enableFilter", value}}),
                        success(R"(<R><WORKSPACE_SUMMARY name="s1"/><WORKSPACE_SUMMARY name="s2"/></R>)"));
    }
    connect();
    for (const auto& [filter, value] : sent) {
        ZELServerStringDict directives;
        if (filter) {
            directives.insert("ENABLE_FILTER", *filter);
        }
        ZELServerVector<IZELServerWorkspaceSummary, ZELServerWorkspaceSummary> summaries;
        const StatusPtr status(repository.getWorkspaceSummariesView(filter ? &directives : nullptr, summaries));
        EXPECT_EQ(status, nullptr) << describe(status.get());
        EXPECT_EQ(summaries.entries(), 2u) << value;
    }
    EXPECT_TRUE(sentCommands(sent.size()));
}

TEST_F(RepositoryTest, FilterWithoutAKnownValueIsRefused)
{
    connect();
    const std::vector<std::optional<std::string>> refused = {std::nullopt, "enabled", "All", "ENABLED ", ""};
    for (const auto& filter : refused) {
        ZELServerStringDict directives;
        directives.insert("OTHER", "x");
        if (filter) {
            directives.insert("ENABLE_FILTER", *filter);
        }
        ZELServerVector<IZELServerWorkspace, ZELServerWorkspace> workspaces;
        const StatusPtr workspacesStatus(repository.getWorkspacesView(&directives, workspaces));
        EXPECT_EQ(numberOf(workspacesStatus), msg::kRequiredValueMissing) << filter.value_or("(missing)");
        ZELServerVector<IZELServerWorkspaceSummary, ZELServerWorkspaceSummary> summaries;
        const StatusPtr summariesStatus(repository.getWorkspaceSummariesView(&directives, summaries));
        EXPECT_EQ(numberOf(summariesStatus), msg::kRequiredValueMissing) << filter.value_or("(missing)");
    }
    EXPECT_TRUE(sentCommands(0));
}

TEST_F(RepositoryTest, ListViewsIgnoreTheirDirectivesAndAskForEverything)
{
    server.exchange(command("REP_GET_CUSTOMFORMATSVIEW", {{"repositoryName", "Samples"}, {"enableFilter", "All"}}),
                    success(R"(<R><CUSTOMFORMAT name="f.zds"/></R>)"))
        .exchange(command("REP_GET_CUSTOMTRANSFORMERSVIEW", {{"repositoryName", "Samples"}, {"enableFilter", "All"}}),
                  success(R"(<R><CUSTOMTRANSFORMER name="t1.zlx"/><CUSTOMTRANSFORMER name="t2.zlx"/></R>)"))
        .exchange(command("REP_GET_TEMPLATESVIEW", {{"repositoryName", "Samples"}, {"enableFilter", "All"}}),
                  success(R"(<R><TEMPLATE name="p.zlwt"/></R>)"))
        .exchange(command("REP_GET_ITEMRESOURCESVIEW",
                          {{"repositoryName", "Samples"}, {"itemName", "a.zlw"}, {"enableFilter", "All"}}),
                  success(R"(<R><RESOURCE name="r1"/><RESOURCE name="r2"/><RESOURCE name="r3"/></R>)"));
    connect();
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
    EXPECT_EQ(formats.entries(), 1u);
    EXPECT_EQ(transformers.entries(), 2u);
    EXPECT_EQ(templates.entries(), 1u);
    EXPECT_EQ(resources.entries(), 3u);
    EXPECT_TRUE(sentCommands(4));
}

TEST_F(RepositoryTest, SingleViewsFillTheCallersObjectAndSetFound)
{
    server.exchange(command("REP_GET_WORKSPACEVIEW", {{"repositoryName", "Samples"}, {"workspaceName", "roads.zlw"}}),
                    success(R"(<R><WORKSPACE_DEFINITIONS workspace_id="w1" name="roads.zlw">)"
                            R"(<DATASET name="A" is_source="true"/></WORKSPACE_DEFINITIONS></R>)"))
        .exchange(command("REP_GET_CUSTOMFORMATVIEW", {{"repositoryName", "Samples"}, {"customFormatName", "f.zds"}}),
                  success(R"(<R><CUSTOMFORMAT name="f.zds" filesize="12"/></R>)"))
        .exchange(command("REP_GET_CUSTOMTRANSFORMERVIEW",
                          {{"repositoryName", "Samples"}, {"customTransformerName", "t.zlx"}}),
                  success(R"(<R><CUSTOMTRANSFORMER name="t.zlx"/></R>)"))
        .exchange(command("REP_GET_ITEMRESOURCEVIEW",
                          {{"repositoryName", "Samples"}, {"itemName", "a.zlw"}, {"resourceName", "r.csv"}}),
                  success(R"(<R><RESOURCE name="r.csv" filesize="5"/></R>)"));
    connect();
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
    EXPECT_TRUE(sentCommands(4));
}

// ---- Workspace registrations ------------------------------------------------------------------------

TEST_F(RepositoryTest, WorkspaceServicesFilterAppendsTheWorkspaceName)
{
    server.exchange(command("REP_GET_WORKSPACESERVICES",
                            {{"repositoryName", "Samples"}, {"enableFilter", "All"}, {"workspaceName", "roads.zlw"}}),
                    success(R"(<R><WORKSPACE_SERVICE><WORKSPACE_SUMMARY name="roads.zlw" is_enabled="true"/>)"
                            R"(<SERVICE service_id="3" name="download" is_workspace_reg_allowed="true"/>)"
                            R"(</WORKSPACE_SERVICE></R>)"))
        .exchange(command("REP_GET_WORKSPACESERVICES",
                          {{"repositoryName", "Samples"}, {"enableFilter", "Disabled"}, {"workspaceName", "w"}}),
                  success("<R/>"))
        .exchange(command("REP_GET_WORKSPACESERVICES", {{"repositoryName", "Samples"}, {"enableFilter", "All"}}),
                  success("<R/>"));
    connect();
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
    EXPECT_EQ(numberOf(StatusPtr(repository.getWorkspaceServices(&unknown, registrations))), msg::kRequiredValueMissing);
    EXPECT_TRUE(sentCommands(3));
}

TEST_F(RepositoryTest, RegisteringAndDeregisteringAWorkspace)
{
    server.exchange(command("REP_REGISTER_WORKSPACESERVICE",
                            {{"repositoryName", "Samples"}, {"workspaceName", "roads.zlw"}, {"serviceName", "download"}}),
                    success("true"))
        .exchange(command("REP_DEREGISTER_WORKSPACESERVICE",
                          {{"repositoryName", "Samples"}, {"workspaceName", "roads.zlw"}, {"serviceName", "download"}}),
                  success("true"));
    connect();
    EXPECT_EQ(StatusPtr(repository.registerWorkspaceService(S("roads.zlw"), S("download"))), nullptr);
    unsigned deregistered = 0;
    EXPECT_EQ(StatusPtr(repository.deregisterWorkspaceService(S("roads.zlw"), S("download"), deregistered)), nullptr);
    EXPECT_EQ(deregistered, 1u);
    EXPECT_TRUE(sentCommands(2));
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
