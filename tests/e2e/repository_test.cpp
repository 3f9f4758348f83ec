// Repositories and services end to end: each operation of the repository manager, of a repository
// and of a service against the local server, with the refusals as the library reports them. The
// server's own texts for each refusal are the server suite's to check.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

const char* kWorkspace = "#!/bin/sh\n"
                         "# @title Roads\n"
                         "# @parameter SOURCE | FILENAME | in.csv | Where to read\n"
                         "# @source CSV | roads | /data/roads.csv\n"
                         "# @featuretype road | A road\n"
                         "# @attribute id | zel_int32 | 10 | 0\n"
                         "true\n";

class Repositories : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        session = &client.session();
        manager = session->getRepositoryManager();
        repo = client.repository("roads");
        for (const auto& [name, content] : {std::pair{"roads.zlw", kWorkspace},
                                            {"off.zlw", "# @enabled false\n"},
                                            {"fmt.zds", "# @title Format\n"},
                                            {"tr.zlx", "plain"},
                                            {"page.zlwt", "# @title Page\n"}})
            ASSERT_EQ(addItem(client, *repo, name, content), 0u) << name << ": " << client.lastMessage();
    }

    void TearDown() override
    {
        if (session != nullptr)
            session->destroyRepository(&repo);
    }

    IZELServerString& text(const std::string& value) { return client.text(value); }

    Client client;
    IZELServerSession* session = nullptr;
    IZELServerRepositoryManager* manager = nullptr;
    IZELServerRepository* repo = nullptr;
};

TEST_F(Repositories, TheManagerAddsListsAndRemovesRepositories)
{
    EXPECT_EQ(client.take(manager->addRepository(text("roads"), text(""))), kRefused) << "a duplicate";
    EXPECT_EQ(client.take(manager->addRepository(text("second"), text("Two"))), 0u);
    auto all = client.own(session->createRepositoryVector(), &Session::destroyRepositoryVector);
    EXPECT_EQ(client.take(manager->getRepositories(nullptr, *all)), 0u);
    EXPECT_EQ(all->entries(), 2u);
    auto absent = client.own(session->createRepository(), &Session::destroyRepository);
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->getRepository(text("absent"), *absent, f); }), 0);
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->removeRepository(text("second"), f); }), 1);
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->removeRepository(text("second"), f); }), 0);
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->repositoryExists(text("second"), f); }), 0);
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->repositoryExists(text("roads"), f); }), 1);

    ZELServerStringDict global;
    global.insert("GLOBAL", "ALLITEMS");
    auto items = client.own(session->createPropertyAccessor(), &Session::destroyPropertyAccessor);
    EXPECT_EQ(client.take(manager->getGlobalItems(&global, *items)), 0u) << client.lastMessage();
    IZELServerString& kind = client.text();
    EXPECT_TRUE(items->getPropertyValue(text("roads"), text("roads.zlw"), kind));
    EXPECT_STREQ(kind.c_str(), "WORKSPACE");
}

TEST_F(Repositories, ItemsAndResourcesAreAddedUpdatedFetchedAndRemoved)
{
    IZELServerString& roads = text("roads.zlw");
    writeFile(local("v2.zlw"), "#!/bin/sh\n# @title Roads 2\ntrue\n");
    EXPECT_EQ(client.take(repo->updateItem(roads, text(local("v2.zlw")))), 0u);
    EXPECT_EQ(addItem(client, *repo, "roads.zlw", "again"), kRefused) << "refused before the transfer";
    EXPECT_EQ(addItem(client, *repo, "bad.zlw", "#!/bin/sh\n# @colour red\ntrue\n"), kRefused) << "and after it";
    EXPECT_NE(client.lastMessage().find("unknown key '@colour'"), std::string::npos) << client.lastMessage();

    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getItem(roads, text(local("got.zlw")), f); }), 1);
    EXPECT_EQ(readAll(local("got.zlw")), readAll(local("v2.zlw")));
    writeFile(local("kept.zlw"), "kept");
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getItem(text("no.zlw"), text(local("kept.zlw")), f); }), -1);
    EXPECT_EQ(readAll(local("kept.zlw")), "kept") << "a failed download leaves the destination alone";

    IZELServerString& r = text("r.txt");
    writeFile(local("r1"), "first");
    writeFile(local("r2"), "second!");
    EXPECT_EQ(client.take(repo->addItemResource(roads, r, text(local("r1")))), 0u);
    EXPECT_EQ(client.take(repo->updateItemResource(roads, r, text(local("r2")))), 0u);
    EXPECT_EQ(client.take(repo->updateItemResource(roads, text("no.txt"), text(local("r2")))), kRefused);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->itemResourceExists(roads, r, f); }), 1);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getItemResource(roads, r, text(local("r3")), f); }), 1);
    EXPECT_EQ(readAll(local("r3")), "second!");
    auto resource = client.own(session->createResource(), &Session::destroyResource);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getItemResourceView(roads, r, *resource, f); }), 1);
    EXPECT_EQ(resource->getFileSize(), 7);
    auto resources = client.own(session->createResourceVector(), &Session::destroyResourceVector);
    EXPECT_EQ(client.take(repo->getItemResourcesView(roads, nullptr, *resources)), 0u);
    EXPECT_EQ(resources->entries(), 1u);

    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->removeItemResource(roads, r, f); }), 1);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->removeItem(roads, f); }), 1);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->itemExists(roads, f); }), 0);
    unsigned removed = 1;
    EXPECT_EQ(client.take(repo->removeItemResource(roads, r, removed)), kRefused) << "the item is gone";
    EXPECT_EQ(removed, 0u);
}

TEST_F(Repositories, ViewsDescribeTheItemsByKind)
{
    ZELServerStringDict enabled;
    enabled.insert("ENABLE_FILTER", "ENABLED");
    auto summaries = client.own(session->createWorkspaceSummaryVector(), &Session::destroyWorkspaceSummaryVector);
    EXPECT_EQ(client.take(repo->getWorkspaceSummariesView(&enabled, *summaries)), 0u) << client.lastMessage();
    EXPECT_EQ(summaries->entries(), 1u) << "the disabled workspace is filtered out";
    ZELServerStringDict wrong;
    wrong.insert("ENABLE_FILTER", "SOME");
    EXPECT_EQ(client.take(repo->getWorkspaceSummariesView(&wrong, *summaries)), 393619u) << "refused before sending";
    auto workspaces = client.own(session->createWorkspaceVector(), &Session::destroyWorkspaceVector);
    EXPECT_EQ(client.take(repo->getWorkspacesView(nullptr, *workspaces)), 0u);
    EXPECT_EQ(workspaces->entries(), 2u);

    IZELServerString& title = client.text();
    auto workspace = client.own(session->createWorkspace(), &Session::destroyWorkspace);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getWorkspaceView(text("roads.zlw"), *workspace, f); }), 1);
    workspace->getTitle(title);
    EXPECT_STREQ(title.c_str(), "Roads");
    EXPECT_EQ(workspace->getParameters().entries(), 1u);
    EXPECT_EQ(workspace->getSourceDatasets().entries(), 1u);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getWorkspaceView(text("no.zlw"), *workspace, f); }), 0);

    auto format = client.own(session->createCustomFormat(), &Session::destroyCustomFormat);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getCustomFormatView(text("fmt.zds"), *format, f); }), 1);
    format->getTitle(title);
    EXPECT_STREQ(title.c_str(), "Format");
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getCustomFormatView(text("roads.zlw"), *format, f); }), 0)
        << "a workspace is no custom format";
    auto formats = client.own(session->createCustomFormatVector(), &Session::destroyCustomFormatVector);
    EXPECT_EQ(client.take(repo->getCustomFormatsView(nullptr, *formats)), 0u);
    EXPECT_EQ(formats->entries(), 1u);

    auto transformer = client.own(session->createCustomTransformer(), &Session::destroyCustomTransformer);
    IZELServerString& tr = text("tr.zlx");
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getCustomTransformerView(tr, *transformer, f); }), 1);
    auto transformers = client.own(session->createCustomTransformerVector(), &Session::destroyCustomTransformerVector);
    EXPECT_EQ(client.take(repo->getCustomTransformersView(nullptr, *transformers)), 0u);
    EXPECT_EQ(transformers->entries(), 1u);

    auto page = client.own(session->createTemplate(), &Session::destroyTemplate);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->getTemplateView(text("page.zlwt"), *page, f); }), 1);
    page->getTitle(title);
    EXPECT_STREQ(title.c_str(), "Page");
    auto pages = client.own(session->createTemplateVector(), &Session::destroyTemplateVector);
    EXPECT_EQ(client.take(repo->getTemplatesView(nullptr, *pages)), 0u);
    EXPECT_EQ(pages->entries(), 1u);
}

TEST_F(Repositories, ServicesAndRegistrations)
{
    auto service = client.own(session->createService(text("pub"), text("Publisher"), text("first"), text("")),
                              &Session::destroyService);
    EXPECT_EQ(service->isEnabled(), 1u) << "a new service is enabled and open to workspaces only";
    EXPECT_EQ(service->isWorkspaceRegistrationAllowed(), 1u);
    EXPECT_EQ(service->isRegistrationAllowed(2), 0u);
    service->setRegistrationAllowed(2, 1);
    ASSERT_EQ(client.take(manager->addService(*service)), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(manager->addService(*service)), kRefused) << "a duplicate";
    service->setDescription(text("second"));
    EXPECT_EQ(client.take(manager->updateService(*service)), 0u) << client.lastMessage();
    auto ghost =
        client.own(session->createService(text("ghost"), text(""), text(""), text("")), &Session::destroyService);
    EXPECT_EQ(client.take(manager->updateService(*ghost)), kRefused) << "an unknown service";

    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->serviceExists(text("pub"), f); }), 1);
    auto services = client.own(session->createServiceVector(), &Session::destroyServiceVector);
    EXPECT_EQ(client.take(manager->getServices(nullptr, *services)), 0u);
    EXPECT_EQ(services->entries(), 1u);
    auto fetched = client.own(session->createService(), &Session::destroyService);
    ASSERT_EQ(client.flag([&](unsigned& f) { return manager->getService(text("pub"), *fetched, f); }), 1);
    IZELServerString& description = client.text();
    fetched->getDescription(description);
    EXPECT_STREQ(description.c_str(), "second");
    EXPECT_EQ(fetched->isRegistrationAllowed(2), 1u) << "the server kept the flags";
    EXPECT_EQ(fetched->isRegistrationAllowed(3), 0u);

    IZELServerString& repository = text("roads");
    IZELServerString& format = text("fmt.zds");
    EXPECT_EQ(client.take(fetched->registerItem(repository, format)), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(fetched->registerItem(repository, format)), kRefused) << "twice";
    EXPECT_EQ(client.flag([&](unsigned& f) { return fetched->itemRegistered(repository, format, f); }), 1);
    auto items = client.own(session->createItemVector(), &Session::destroyItemVector);
    EXPECT_EQ(client.take(fetched->getRegisteredItems(nullptr, *items)), 0u);
    EXPECT_EQ(items->entries(), 1u);
    EXPECT_EQ(client.flag([&](unsigned& f) { return fetched->deregisterItem(repository, format, f); }), 1);

    IZELServerString& roads = text("roads.zlw");
    EXPECT_EQ(client.take(repo->registerWorkspaceService(roads, text("pub"))), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(repo->registerWorkspaceService(format, text("pub"))), kRefused) << "no workspace";
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->workspaceServiceExists(roads, text("pub"), f); }), 1);
    auto registrations = client.own(session->createWorkspaceServiceVector(), &Session::destroyWorkspaceServiceVector);
    EXPECT_EQ(client.take(repo->getWorkspaceServices(nullptr, *registrations)), 0u) << client.lastMessage();
    EXPECT_EQ(registrations->entries(), 1u);
    EXPECT_EQ(client.flag([&](unsigned& f) { return repo->deregisterWorkspaceService(roads, text("pub"), f); }), 1);

    IZELServerPropertyAccessor& properties = fetched->getPropertyAccessor();
    properties.setProperty(text("cat"), text("key"), text("value"));
    EXPECT_EQ(client.take(fetched->updatePropertyAccessor(properties)), 0u) << client.lastMessage();
    auto again = client.own(session->createService(), &Session::destroyService);
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->getService(text("pub"), *again, f); }), 1);
    IZELServerString& value = client.text();
    EXPECT_TRUE(again->getPropertyAccessor().getPropertyValue(text("cat"), text("key"), value));
    EXPECT_STREQ(value.c_str(), "value");
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->removeService(text("pub"), f); }), 1);
    EXPECT_EQ(client.take(again->updatePropertyAccessor(again->getPropertyAccessor())), kRefused) << "it is gone";
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->removeService(text("pub"), f); }), 0);
}

TEST_F(Repositories, WorkspaceAndDatasetPropertiesAreReplacedByTheirAccessors)
{
    auto workspace = client.own(session->createWorkspace(), &Session::destroyWorkspace);
    ASSERT_EQ(client.flag([&](unsigned& f) { return repo->getWorkspaceView(text("roads.zlw"), *workspace, f); }), 1);
    IZELServerPropertyAccessor& own = workspace->getPropertyAccessor();
    own.setProperty(text("ui"), text("colour"), text("green"));
    EXPECT_EQ(client.take(workspace->updatePropertyAccessor(own)), 0u) << client.lastMessage();
    ASSERT_EQ(workspace->getSourceDatasets().entries(), 1u);
    IZELServerDataset& dataset = *workspace->getSourceDatasets().element(0);
    IZELServerPropertyAccessor& datasetOwn = dataset.getPropertyAccessor();
    datasetOwn.setProperty(text("io"), text("encoding"), text("utf-8"));
    EXPECT_EQ(client.take(dataset.updatePropertyAccessor(datasetOwn)), 0u) << client.lastMessage();

    auto again = client.own(session->createWorkspace(), &Session::destroyWorkspace);
    ASSERT_EQ(client.flag([&](unsigned& f) { return repo->getWorkspaceView(text("roads.zlw"), *again, f); }), 1);
    IZELServerString& value = client.text();
    EXPECT_TRUE(again->getPropertyAccessor().getPropertyValue(text("ui"), text("colour"), value));
    EXPECT_STREQ(value.c_str(), "green");
    ASSERT_EQ(again->getSourceDatasets().entries(), 1u);
    EXPECT_TRUE(again->getSourceDatasets().element(0)->getPropertyAccessor().getPropertyValue(text("io"),
                                                                                              text("encoding"), value));
    EXPECT_STREQ(value.c_str(), "utf-8");

    ASSERT_EQ(client.flag([&](unsigned& f) { return repo->removeItem(text("roads.zlw"), f); }), 1);
    EXPECT_EQ(client.take(workspace->updatePropertyAccessor(own)), kRefused) << "the workspace is gone";
    EXPECT_EQ(client.take(dataset.updatePropertyAccessor(datasetOwn)), kRefused);
}

}  // namespace
}  // namespace zeltest
