// Repositories and services end to end: each operation of the repository manager, of a repository
// and of a service once with success and once refused by the server.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

const char* kWorkspace =
    "#!/bin/sh\n"
    "# @title Roads\n"
    "# @parameter SOURCE | FILENAME | in.csv | Where to read\n"
    "# @source CSV | roads | /data/roads.csv\n"
    "# @featuretype road | A road\n"
    "# @attribute id | zel_int32 | 10 | 0\n"
    "true\n";
const char* kDisabled = "#!/bin/sh\n# @enabled false\ntrue\n";

class Repositories : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        session = &client.session();
        manager = session->getRepositoryManager();
        repo = client.repository("roads");
        for (const auto& [name, content] : {std::pair{"roads.zlw", kWorkspace}, {"off.zlw", kDisabled},
                                            {"fmt.zds", "# @title Format\n"}, {"tr.zlx", "plain"},
                                            {"page.zlwt", "# @title Page\n"}}) {
            writeFile(local(name), content);
            ASSERT_EQ(client.take(repo->addItem(client.text(name), client.text(local(name)))), 0u)
                << name << ": " << client.lastMessage();
        }
    }

    void TearDown() override
    {
        if (session != nullptr)
            session->destroyRepository(&repo);
    }

    Client client;
    IZELServerSession* session = nullptr;
    IZELServerRepositoryManager* manager = nullptr;
    IZELServerRepository* repo = nullptr;
};

TEST_F(Repositories, TheManagerAddsListsAndRemovesRepositories)
{
    unsigned flag = 0;
    EXPECT_EQ(client.take(manager->repositoryExists(client.text("roads"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    EXPECT_EQ(client.take(manager->addRepository(client.text("roads"), client.text(""))), 393625u) << "a duplicate";
    EXPECT_EQ(client.take(manager->addRepository(client.text("second"), client.text("Two"))), 0u);

    IZELServerVector<IZELServerRepository>* all = session->createRepositoryVector();
    EXPECT_EQ(client.take(manager->getRepositories(nullptr, *all)), 0u);
    EXPECT_EQ(all->entries(), 2u);
    session->destroyRepositoryVector(&all);

    IZELServerRepository* absent = session->createRepository();
    flag = 1;
    EXPECT_EQ(client.take(manager->getRepository(client.text("absent"), *absent, flag)), 0u);
    EXPECT_EQ(flag, 0u);
    session->destroyRepository(&absent);

    EXPECT_EQ(client.take(manager->removeRepository(client.text("second"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    EXPECT_EQ(client.take(manager->removeRepository(client.text("second"), flag)), 0u);
    EXPECT_EQ(flag, 0u);
    EXPECT_EQ(client.take(manager->repositoryExists(client.text("second"), flag)), 0u);
    EXPECT_EQ(flag, 0u);

    ZELServerStringDict global;
    global.insert("GLOBAL", "ALLITEMS");
    IZELServerPropertyAccessor* items = session->createPropertyAccessor();
    EXPECT_EQ(client.take(manager->getGlobalItems(&global, *items)), 0u) << client.lastMessage();
    IZELServerString& kind = client.text();
    EXPECT_TRUE(items->getPropertyValue(client.text("roads"), client.text("roads.zlw"), kind));
    EXPECT_STREQ(kind.c_str(), "WORKSPACE");
    session->destroyPropertyAccessor(&items);
}

TEST_F(Repositories, ItemsAndResourcesAreAddedUpdatedFetchedAndRemoved)
{
    writeFile(local("v2.zlw"), "#!/bin/sh\n# @title Roads 2\ntrue\n");
    EXPECT_EQ(client.take(repo->updateItem(client.text("roads.zlw"), client.text(local("v2.zlw")))), 0u);
    EXPECT_EQ(client.take(repo->updateItem(client.text("absent.zlw"), client.text(local("v2.zlw")))), 393625u);
    EXPECT_EQ(client.take(repo->addItem(client.text("roads.zlw"), client.text(local("v2.zlw")))), 393625u);
    writeFile(local("bad.zlw"), "#!/bin/sh\n# @colour red\ntrue\n");
    EXPECT_EQ(client.take(repo->addItem(client.text("bad.zlw"), client.text(local("bad.zlw")))), 393625u);
    EXPECT_NE(client.lastMessage().find("unknown key '@colour'"), std::string::npos) << client.lastMessage();

    unsigned flag = 0;
    EXPECT_EQ(client.take(repo->getItem(client.text("roads.zlw"), client.text(local("got.zlw")), flag)), 0u);
    EXPECT_EQ(readAll(local("got.zlw")), readAll(local("v2.zlw")));
    writeFile(local("kept.zlw"), "kept");
    EXPECT_NE(client.take(repo->getItem(client.text("absent.zlw"), client.text(local("kept.zlw")), flag)), 0u);
    EXPECT_EQ(readAll(local("kept.zlw")), "kept") << "a failed download leaves the destination alone";

    writeFile(local("r1"), "first");
    writeFile(local("r2"), "second!");
    EXPECT_EQ(client.take(repo->addItemResource(client.text("roads.zlw"), client.text("r.txt"), client.text(local("r1")))), 0u);
    EXPECT_EQ(client.take(repo->addItemResource(client.text("roads.zlw"), client.text("r.txt"), client.text(local("r1")))),
              393625u);
    EXPECT_EQ(client.take(repo->updateItemResource(client.text("roads.zlw"), client.text("r.txt"), client.text(local("r2")))),
              0u);
    EXPECT_EQ(client.take(repo->updateItemResource(client.text("roads.zlw"), client.text("no.txt"), client.text(local("r2")))),
              393625u);
    EXPECT_EQ(client.take(repo->itemResourceExists(client.text("roads.zlw"), client.text("r.txt"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    EXPECT_EQ(client.take(repo->getItemResource(client.text("roads.zlw"), client.text("r.txt"), client.text(local("r3")), flag)),
              0u);
    EXPECT_EQ(readAll(local("r3")), "second!");

    IZELServerResource* resource = session->createResource();
    EXPECT_EQ(client.take(repo->getItemResourceView(client.text("roads.zlw"), client.text("r.txt"), *resource, flag)), 0u);
    EXPECT_EQ(flag, 1u);
    EXPECT_EQ(resource->getFileSize(), 7);
    session->destroyResource(&resource);
    IZELServerVector<IZELServerResource>* resources = session->createResourceVector();
    EXPECT_EQ(client.take(repo->getItemResourcesView(client.text("roads.zlw"), nullptr, *resources)), 0u);
    EXPECT_EQ(resources->entries(), 1u);
    EXPECT_EQ(client.take(repo->getItemResourcesView(client.text("absent.zlw"), nullptr, *resources)), 393625u);
    session->destroyResourceVector(&resources);

    EXPECT_EQ(client.take(repo->removeItemResource(client.text("roads.zlw"), client.text("r.txt"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    EXPECT_EQ(client.take(repo->removeItem(client.text("roads.zlw"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    EXPECT_EQ(client.take(repo->itemExists(client.text("roads.zlw"), flag)), 0u);
    EXPECT_EQ(flag, 0u);
    EXPECT_EQ(client.take(repo->removeItemResource(client.text("roads.zlw"), client.text("r.txt"), flag)), 393625u)
        << "the item is gone";
}

TEST_F(Repositories, ViewsDescribeTheItemsByKind)
{
    ZELServerStringDict enabled;
    enabled.insert("ENABLE_FILTER", "ENABLED");
    IZELServerVector<IZELServerWorkspaceSummary>* summaries = session->createWorkspaceSummaryVector();
    EXPECT_EQ(client.take(repo->getWorkspaceSummariesView(&enabled, *summaries)), 0u) << client.lastMessage();
    EXPECT_EQ(summaries->entries(), 1u) << "the disabled workspace is filtered out";
    ZELServerStringDict wrong;
    wrong.insert("ENABLE_FILTER", "SOME");
    EXPECT_EQ(client.take(repo->getWorkspaceSummariesView(&wrong, *summaries)), 393619u);
    session->destroyWorkspaceSummaryVector(&summaries);

    IZELServerVector<IZELServerWorkspace>* workspaces = session->createWorkspaceVector();
    EXPECT_EQ(client.take(repo->getWorkspacesView(nullptr, *workspaces)), 0u);
    EXPECT_EQ(workspaces->entries(), 2u);
    session->destroyWorkspaceVector(&workspaces);
    IZELServerWorkspace* workspace = session->createWorkspace();
    unsigned found = 0;
    EXPECT_EQ(client.take(repo->getWorkspaceView(client.text("roads.zlw"), *workspace, found)), 0u);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(workspace->getParameters().entries(), 1u);
    EXPECT_EQ(workspace->getSourceDatasets().entries(), 1u);
    EXPECT_EQ(client.take(repo->getWorkspaceView(client.text("absent.zlw"), *workspace, found)), 0u);
    EXPECT_EQ(found, 0u);
    session->destroyWorkspace(&workspace);

    IZELServerCustomFormat* format = session->createCustomFormat();
    EXPECT_EQ(client.take(repo->getCustomFormatView(client.text("fmt.zds"), *format, found)), 0u);
    EXPECT_EQ(found, 1u);
    IZELServerString& title = client.text();
    format->getTitle(title);
    EXPECT_STREQ(title.c_str(), "Format");
    EXPECT_EQ(client.take(repo->getCustomFormatView(client.text("roads.zlw"), *format, found)), 0u);
    EXPECT_EQ(found, 0u) << "a workspace is no custom format";
    session->destroyCustomFormat(&format);
    IZELServerVector<IZELServerCustomFormat>* formats = session->createCustomFormatVector();
    EXPECT_EQ(client.take(repo->getCustomFormatsView(nullptr, *formats)), 0u);
    EXPECT_EQ(formats->entries(), 1u);
    session->destroyCustomFormatVector(&formats);

    IZELServerCustomTransformer* transformer = session->createCustomTransformer();
    EXPECT_EQ(client.take(repo->getCustomTransformerView(client.text("tr.zlx"), *transformer, found)), 0u);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(client.take(repo->getCustomTransformerView(client.text("no.zlx"), *transformer, found)), 0u);
    EXPECT_EQ(found, 0u);
    session->destroyCustomTransformer(&transformer);
    IZELServerVector<IZELServerCustomTransformer>* transformers = session->createCustomTransformerVector();
    EXPECT_EQ(client.take(repo->getCustomTransformersView(nullptr, *transformers)), 0u);
    EXPECT_EQ(transformers->entries(), 1u);
    session->destroyCustomTransformerVector(&transformers);

    IZELServerTemplate* page = session->createTemplate();
    EXPECT_EQ(client.take(repo->getTemplateView(client.text("page.zlwt"), *page, found)), 0u);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(client.take(repo->getTemplateView(client.text("no.zlwt"), *page, found)), 0u);
    EXPECT_EQ(found, 0u);
    session->destroyTemplate(&page);
    IZELServerVector<IZELServerTemplate>* pages = session->createTemplateVector();
    EXPECT_EQ(client.take(repo->getTemplatesView(nullptr, *pages)), 0u);
    EXPECT_EQ(pages->entries(), 1u);
    session->destroyTemplateVector(&pages);
}

TEST_F(Repositories, ServicesAndRegistrations)
{
    IZELServerService* service = session->createService(client.text("pub"), client.text("Publisher"),
                                                        client.text("first"), client.text("http://pub"));
    service->setRegistrationAllowed(2, 1);
    ASSERT_EQ(client.take(manager->addService(*service)), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(manager->addService(*service)), 393625u) << "a duplicate";
    service->setDescription(client.text("second"));
    EXPECT_EQ(client.take(manager->updateService(*service)), 0u) << client.lastMessage();
    session->destroyService(&service);

    IZELServerService* ghost = session->createService(client.text("ghost"), client.text(""), client.text(""), client.text(""));
    EXPECT_EQ(client.take(manager->updateService(*ghost)), 393625u) << "an unknown service";
    session->destroyService(&ghost);

    unsigned flag = 0;
    EXPECT_EQ(client.take(manager->serviceExists(client.text("pub"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    IZELServerVector<IZELServerService>* services = session->createServiceVector();
    EXPECT_EQ(client.take(manager->getServices(nullptr, *services)), 0u);
    EXPECT_EQ(services->entries(), 1u);
    session->destroyServiceVector(&services);
    IZELServerService* fetched = session->createService();
    EXPECT_EQ(client.take(manager->getService(client.text("pub"), *fetched, flag)), 0u);
    ASSERT_EQ(flag, 1u);
    IZELServerString& description = client.text();
    fetched->getDescription(description);
    EXPECT_STREQ(description.c_str(), "second");
    EXPECT_EQ(fetched->isWorkspaceRegistrationAllowed(), 1u) << "the server kept the flag";
    EXPECT_EQ(fetched->isRegistrationAllowed(2), 1u);
    EXPECT_EQ(fetched->isRegistrationAllowed(3), 0u);

    EXPECT_EQ(client.take(fetched->registerItem(client.text("roads"), client.text("fmt.zds"))), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(fetched->registerItem(client.text("roads"), client.text("fmt.zds"))), 393625u) << "twice";
    EXPECT_EQ(client.take(fetched->itemRegistered(client.text("roads"), client.text("fmt.zds"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    IZELServerVector<IZELServerItem>* items = session->createItemVector();
    EXPECT_EQ(client.take(fetched->getRegisteredItems(nullptr, *items)), 0u);
    EXPECT_EQ(items->entries(), 1u);
    session->destroyItemVector(&items);
    EXPECT_EQ(client.take(fetched->deregisterItem(client.text("roads"), client.text("fmt.zds"), flag)), 0u);
    EXPECT_EQ(flag, 1u);

    EXPECT_EQ(client.take(repo->registerWorkspaceService(client.text("roads.zlw"), client.text("pub"))), 0u)
        << client.lastMessage();
    EXPECT_EQ(client.take(repo->registerWorkspaceService(client.text("fmt.zds"), client.text("pub"))), 393625u)
        << "not a workspace";
    EXPECT_EQ(client.take(repo->workspaceServiceExists(client.text("roads.zlw"), client.text("pub"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    IZELServerVector<IZELServerWorkspaceService>* registrations = session->createWorkspaceServiceVector();
    EXPECT_EQ(client.take(repo->getWorkspaceServices(nullptr, *registrations)), 0u) << client.lastMessage();
    EXPECT_EQ(registrations->entries(), 1u);
    session->destroyWorkspaceServiceVector(&registrations);
    EXPECT_EQ(client.take(repo->deregisterWorkspaceService(client.text("roads.zlw"), client.text("pub"), flag)), 0u);
    EXPECT_EQ(flag, 1u);

    IZELServerPropertyAccessor& properties = fetched->getPropertyAccessor();
    properties.setProperty(client.text("cat"), client.text("key"), client.text("value"));
    EXPECT_EQ(client.take(fetched->updatePropertyAccessor(properties)), 0u) << client.lastMessage();
    session->destroyService(&fetched);
    fetched = session->createService();
    EXPECT_EQ(client.take(manager->getService(client.text("pub"), *fetched, flag)), 0u);
    IZELServerString& value = client.text();
    EXPECT_TRUE(fetched->getPropertyAccessor().getPropertyValue(client.text("cat"), client.text("key"), value));
    EXPECT_STREQ(value.c_str(), "value");

    EXPECT_EQ(client.take(manager->removeService(client.text("pub"), flag)), 0u);
    EXPECT_EQ(flag, 1u);
    EXPECT_EQ(client.take(fetched->updatePropertyAccessor(fetched->getPropertyAccessor())), 393625u)
        << "the service is gone";
    session->destroyService(&fetched);
    EXPECT_EQ(client.take(manager->removeService(client.text("pub"), flag)), 0u);
    EXPECT_EQ(flag, 0u);
}

TEST_F(Repositories, WorkspaceAndDatasetPropertiesAreReplacedByTheirAccessors)
{
    IZELServerWorkspace* workspace = session->createWorkspace();
    unsigned found = 0;
    ASSERT_EQ(client.take(repo->getWorkspaceView(client.text("roads.zlw"), *workspace, found)), 0u);
    ASSERT_EQ(found, 1u);
    IZELServerPropertyAccessor& own = workspace->getPropertyAccessor();
    own.setProperty(client.text("ui"), client.text("colour"), client.text("green"));
    EXPECT_EQ(client.take(workspace->updatePropertyAccessor(own)), 0u) << client.lastMessage();
    ASSERT_EQ(workspace->getSourceDatasets().entries(), 1u);
    IZELServerDataset& dataset = *workspace->getSourceDatasets().element(0);
    IZELServerPropertyAccessor& datasetOwn = dataset.getPropertyAccessor();
    datasetOwn.setProperty(client.text("io"), client.text("encoding"), client.text("utf-8"));
    EXPECT_EQ(client.take(dataset.updatePropertyAccessor(datasetOwn)), 0u) << client.lastMessage();

    IZELServerWorkspace* again = session->createWorkspace();
    ASSERT_EQ(client.take(repo->getWorkspaceView(client.text("roads.zlw"), *again, found)), 0u);
    IZELServerString& value = client.text();
    EXPECT_TRUE(again->getPropertyAccessor().getPropertyValue(client.text("ui"), client.text("colour"), value));
    EXPECT_STREQ(value.c_str(), "green");
    ASSERT_EQ(again->getSourceDatasets().entries(), 1u);
    EXPECT_TRUE(again->getSourceDatasets().element(0)->getPropertyAccessor().getPropertyValue(
        client.text("io"), client.text("encoding"), value));
    EXPECT_STREQ(value.c_str(), "utf-8");
    session->destroyWorkspace(&again);

    unsigned removed = 0;
    ASSERT_EQ(client.take(repo->removeItem(client.text("roads.zlw"), removed)), 0u);
    EXPECT_EQ(client.take(workspace->updatePropertyAccessor(own)), 393625u) << "the workspace is gone";
    EXPECT_EQ(client.take(dataset.updatePropertyAccessor(datasetOwn)), 393625u);
    session->destroyWorkspace(&workspace);
}

TEST_F(Repositories, ANewServiceIsEnabledAndOpenToWorkspaces)
{
    IZELServerService* service =
        session->createService(client.text("open"), client.text(""), client.text(""), client.text(""));
    EXPECT_EQ(service->isEnabled(), 1u);
    EXPECT_EQ(service->isWorkspaceRegistrationAllowed(), 1u);
    EXPECT_EQ(service->isRegistrationAllowed(2), 0u);
    ASSERT_EQ(client.take(manager->addService(*service)), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(repo->registerWorkspaceService(client.text("roads.zlw"), client.text("open"))), 0u)
        << client.lastMessage();
    session->destroyService(&service);
}

}  // namespace
}  // namespace zeltest
