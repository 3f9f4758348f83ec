// Repositories and services end to end: every operation of the repository manager, of a repository
// and of a service against the local server, with its refusal as the library reports it. The
// server's own texts for each refusal are the server suite's to check.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

const char* kWorkspace = "#!/bin/sh\n# @title Roads\n# @parameter SOURCE | FILENAME | in.csv | Where to read\n"
                         "# @source CSV | roads | /data/roads.csv\n# @featuretype road | A road\n"
                         "# @attribute id | zel_int32 | 10 | 0\ntrue\n";

class Repositories : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        manager = client.session().getRepositoryManager();
        repo = client.repository("roads");
        for (const auto& [name, content] : {std::pair{"roads.zlw", kWorkspace},
                                            {"off.zlw", "# @enabled false\n"},
                                            {"fmt.zds", "# @title Format\n"},
                                            {"tr.zlx", "plain"},
                                            {"page.zlwt", "# @title Page\n"}})
            ASSERT_EQ(addItem(client, *repo, name, content), 0u) << name << ": " << client.lastMessage();
    }

    IZELServerString& t(const std::string& value) { return client.text(value); }
    std::function<bool()> holds(const std::string& name, const std::string& content)
    {
        return [this, name, content] { return slurp(local(name)) == content; };
    }
    // A check of the title or the description of a view, read through `get` when it runs.
    template <typename View>
    std::function<bool()> reads(View& view, void (View::*get)(IZELServerString&) const, const std::string& expected)
    {
        return [this, &view, get, expected] {
            IZELServerString& text = client.text();
            (view.*get)(text);
            return text.equals(expected.c_str());
        };
    }

    Client client;
    IZELServerRepositoryManager* manager = nullptr;
    ZELServerOwned<IZELServerRepository> repo;
};

TEST_F(Repositories, TheManagerAndItsRepositories)
{
    IZELServerSession& s = client.session();
    auto all = client.own(s.createRepositoryVector());
    auto second = client.own(s.createRepository());
    auto items = client.own(s.createPropertyAccessor());
    auto workspace = client.own(s.createWorkspace());
    ZELServerStringDict global;
    global.insert("GLOBAL", "ALLITEMS");
    IZELServerString& kind = client.text();
    client.run({
        {"a duplicate", [&](unsigned&) { return manager->addRepository(t("roads"), t("")); }, kDenied},
        {"add", [&](unsigned&) { return manager->addRepository(t("second"), t("Two")); }, kUntouched},
        {"list", counting(*all, [&] { return manager->getRepositories(nullptr, *all); }), 2},
        {"get",
         checking([&](unsigned& f) { return manager->getRepository(t("second"), *second, f); },
                  reads(*second, &IZELServerRepository::getDescription, "Two")),
         1},
        {"get the absent", [&](unsigned& f) { return manager->getRepository(t("absent"), *second, f); }, 0},
        {"exists", [&](unsigned& f) { return manager->repositoryExists(t("second"), f); }, 1},
        {"global items",
         checking(
             [&](unsigned&) { return manager->getGlobalItems(&global, *items); },
             [&] { return items->getPropertyValue(t("roads"), t("roads.zlw"), kind) && kind.equals("WORKSPACE"); }),
         kUntouched},
        {"remove", [&](unsigned& f) { return manager->removeRepository(t("second"), f); }, 1},
        {"remove again", [&](unsigned& f) { return manager->removeRepository(t("second"), f); }, 0},
        {"exists no more", [&](unsigned& f) { return manager->repositoryExists(t("second"), f); }, 0},
    });

    // Each kind of operation of a repository that is gone is refused, and answers nothing.
    IZELServerRepository& gone = *second;
    IZELServerString& item = t("roads.zlw");
    IZELServerString& file = t(local("roads.zlw"));
    client.run({
        {"itemExists", [&](unsigned& f) { return gone.itemExists(item, f); }, kDenied},
        {"addItem", [&](unsigned&) { return gone.addItem(item, file); }, kDenied},
        {"getWorkspaceView", [&](unsigned& f) { return gone.getWorkspaceView(item, *workspace, f); }, kDenied},
    });
}

TEST_F(Repositories, ItemsAndResources)
{
    const std::string v2 = "#!/bin/sh\n# @title Roads 2\ntrue\n";
    spew(local("v2.zlw"), v2);
    spew(local("bad.zlw"), "#!/bin/sh\n# @colour red\ntrue\n");
    spew(local("empty"), "");
    spew(local("r1"), "first");
    spew(local("r2"), "second!");
    spew(local("kept"), "kept");
    IZELServerString& roads = t("roads.zlw");
    IZELServerString& r = t("r.txt");
    auto resource = client.own(client.session().createResource());
    auto resources = client.own(client.session().createResourceVector());
    client.run({
        {"update", [&](unsigned&) { return repo->updateItem(roads, t(local("v2.zlw"))); }, kUntouched},
        {"update a missing item", [&](unsigned&) { return repo->updateItem(t("no.zlw"), t(local("v2.zlw"))); },
         kDenied},
        {"add a duplicate: refused before the transfer",
         [&](unsigned&) { return repo->addItem(roads, t(local("v2.zlw"))); }, kDenied},
        {"add a bad header: refused after it",
         [&](unsigned&) { return repo->addItem(t("bad.zlw"), t(local("bad.zlw"))); }, kDenied},
        {"add an empty item", [&](unsigned&) { return repo->addItem(t("empty.zlw"), t(local("empty"))); }, kUntouched},
        {"exists", [&](unsigned& f) { return repo->itemExists(roads, f); }, 1},
        {"get", checking([&](unsigned& f) { return repo->getItem(roads, t(local("got")), f); }, holds("got", v2)), 1},
        {"get a missing item, keeping the destination",
         checking([&](unsigned& f) { return repo->getItem(t("no.zlw"), t(local("kept")), f); }, holds("kept", "kept")),
         kDenied},
        {"an empty item is no file",
         checking([&](unsigned& f) { return repo->getItem(t("empty.zlw"), t(local("kept")), f); },
                  holds("kept", "kept")),
         -393638},
        {"add a resource", [&](unsigned&) { return repo->addItemResource(roads, r, t(local("r1"))); }, kUntouched},
        {"add it again", [&](unsigned&) { return repo->addItemResource(roads, r, t(local("r1"))); }, kDenied},
        {"update it", [&](unsigned&) { return repo->updateItemResource(roads, r, t(local("r2"))); }, kUntouched},
        {"update a missing one", [&](unsigned&) { return repo->updateItemResource(roads, t("no"), t(local("r2"))); },
         kDenied},
        {"resource exists", [&](unsigned& f) { return repo->itemResourceExists(roads, r, f); }, 1},
        {"missing resource", [&](unsigned& f) { return repo->itemResourceExists(roads, t("no"), f); }, 0},
        {"get it",
         checking([&](unsigned& f) { return repo->getItemResource(roads, r, t(local("r3")), f); },
                  holds("r3", "second!")),
         1},
        {"get a missing one",
         checking([&](unsigned& f) { return repo->getItemResource(roads, t("no"), t(local("kept")), f); },
                  holds("kept", "kept")),
         kDenied},
        {"its view",
         checking([&](unsigned& f) { return repo->getItemResourceView(roads, r, *resource, f); },
                  [&] { return resource->getFileSize() == 7; }),
         1},
        {"a missing view", [&](unsigned& f) { return repo->getItemResourceView(roads, t("no"), *resource, f); }, 0},
        {"all views", counting(*resources, [&] { return repo->getItemResourcesView(roads, nullptr, *resources); }), 1},
        {"remove it", [&](unsigned& f) { return repo->removeItemResource(roads, r, f); }, 1},
        {"remove it again", [&](unsigned& f) { return repo->removeItemResource(roads, r, f); }, 0},
        {"remove the item", [&](unsigned& f) { return repo->removeItem(roads, f); }, 1},
        {"remove it again", [&](unsigned& f) { return repo->removeItem(roads, f); }, 0},
        {"the item is gone", [&](unsigned& f) { return repo->itemExists(roads, f); }, 0},
        {"and its resources", [&](unsigned& f) { return repo->removeItemResource(roads, r, f); }, kDenied},
    });
}

TEST_F(Repositories, ViewsDescribeTheItemsByKind)
{
    IZELServerSession& s = client.session();
    auto summaries = client.own(s.createWorkspaceSummaryVector());
    auto workspaces = client.own(s.createWorkspaceVector());
    auto workspace = client.own(s.createWorkspace());
    auto formats = client.own(s.createCustomFormatVector());
    auto format = client.own(s.createCustomFormat());
    auto transformers = client.own(s.createCustomTransformerVector());
    auto transformer = client.own(s.createCustomTransformer());
    auto templates = client.own(s.createTemplateVector());
    auto page = client.own(s.createTemplate());
    ZELServerStringDict enabled;
    enabled.insert("ENABLE_FILTER", "ENABLED");
    IZELServerString& roads = t("roads.zlw");
    client.run({
        {"enabled summaries",
         counting(*summaries, [&] { return repo->getWorkspaceSummariesView(&enabled, *summaries); }), 1},
        {"workspaces", counting(*workspaces, [&] { return repo->getWorkspacesView(nullptr, *workspaces); }), 2},
        {"a workspace",
         checking(
             [&](unsigned& f) { return repo->getWorkspaceView(roads, *workspace, f); },
             [&] { return workspace->getParameters().entries() == 1 && workspace->getSourceDatasets().entries() == 1; },
             reads(*workspace, &IZELServerWorkspace::getTitle, "Roads")),
         1},
        {"a missing workspace", [&](unsigned& f) { return repo->getWorkspaceView(t("no.zlw"), *workspace, f); }, 0},
        {"formats", counting(*formats, [&] { return repo->getCustomFormatsView(nullptr, *formats); }), 1},
        {"a format",
         checking([&](unsigned& f) { return repo->getCustomFormatView(t("fmt.zds"), *format, f); },
                  reads(*format, &IZELServerCustomFormat::getTitle, "Format")),
         1},
        {"a workspace is no format", [&](unsigned& f) { return repo->getCustomFormatView(roads, *format, f); }, 0},
        {"transformers",
         counting(*transformers, [&] { return repo->getCustomTransformersView(nullptr, *transformers); }), 1},
        {"a transformer", [&](unsigned& f) { return repo->getCustomTransformerView(t("tr.zlx"), *transformer, f); }, 1},
        {"a missing transformer", [&](unsigned& f) { return repo->getCustomTransformerView(roads, *transformer, f); },
         0},
        {"templates", counting(*templates, [&] { return repo->getTemplatesView(nullptr, *templates); }), 1},
        {"a template",
         checking([&](unsigned& f) { return repo->getTemplateView(t("page.zlwt"), *page, f); },
                  reads(*page, &IZELServerTemplate::getTitle, "Page")),
         1},
        {"a missing template", [&](unsigned& f) { return repo->getTemplateView(roads, *page, f); }, 0},
    });
}

TEST_F(Repositories, ServicesAndRegistrations)
{
    IZELServerSession& s = client.session();
    auto service = client.own(s.createService(t("pub"), t("Publisher"), t("first"), t("")));
    EXPECT_EQ(service->isEnabled(), 1u) << "a new service is enabled and open to workspaces only";
    EXPECT_EQ(service->isWorkspaceRegistrationAllowed(), 1u);
    EXPECT_EQ(service->isRegistrationAllowed(2), 0u);
    service->setRegistrationAllowed(2, 1);
    auto ghost = client.own(s.createService(t("ghost"), t(""), t(""), t("")));
    auto services = client.own(s.createServiceVector());
    auto fetched = client.own(s.createService());
    auto items = client.own(s.createItemVector());
    auto registrations = client.own(s.createWorkspaceServiceVector());
    IZELServerString& repository = t("roads");
    IZELServerString& format = t("fmt.zds");
    IZELServerString& roads = t("roads.zlw");
    IZELServerString& pub = t("pub");
    IZELServerString& value = client.text();
    client.run({
        {"add", [&](unsigned&) { return manager->addService(*service); }, kUntouched},
        {"add a duplicate", [&](unsigned&) { return manager->addService(*service); }, kDenied},
        {"update",
         [&](unsigned&) {
             service->setDescription(t("second"));
             return manager->updateService(*service);
         },
         kUntouched},
        {"update an unknown service", [&](unsigned&) { return manager->updateService(*ghost); }, kDenied},
        {"exists", [&](unsigned& f) { return manager->serviceExists(pub, f); }, 1},
        {"does not exist", [&](unsigned& f) { return manager->serviceExists(t("ghost"), f); }, 0},
        {"list", counting(*services, [&] { return manager->getServices(nullptr, *services); }), 1},
        {"get, with the server's flags",
         checking([&](unsigned& f) { return manager->getService(pub, *fetched, f); },
                  [&] { return fetched->isRegistrationAllowed(2) == 1 && fetched->isRegistrationAllowed(3) == 0; },
                  reads(*fetched, &IZELServerService::getDescription, "second")),
         1},
        {"get the unknown", [&](unsigned& f) { return manager->getService(t("ghost"), *ghost, f); }, 0},
        {"register an item", [&](unsigned&) { return fetched->registerItem(repository, format); }, kUntouched},
        {"register it twice", [&](unsigned&) { return fetched->registerItem(repository, format); }, kDenied},
        {"registered", [&](unsigned& f) { return fetched->itemRegistered(repository, format, f); }, 1},
        {"not registered", [&](unsigned& f) { return fetched->itemRegistered(repository, roads, f); }, 0},
        {"registered items", counting(*items, [&] { return fetched->getRegisteredItems(nullptr, *items); }), 1},
        {"deregister", [&](unsigned& f) { return fetched->deregisterItem(repository, format, f); }, 1},
        {"deregister again", [&](unsigned& f) { return fetched->deregisterItem(repository, format, f); }, 0},
        {"register a workspace", [&](unsigned&) { return repo->registerWorkspaceService(roads, pub); }, kUntouched},
        {"a format is no workspace", [&](unsigned&) { return repo->registerWorkspaceService(format, pub); }, kDenied},
        {"workspace registered", [&](unsigned& f) { return repo->workspaceServiceExists(roads, pub, f); }, 1},
        {"registrations", counting(*registrations, [&] { return repo->getWorkspaceServices(nullptr, *registrations); }),
         1},
        {"deregister it", [&](unsigned& f) { return repo->deregisterWorkspaceService(roads, pub, f); }, 1},
        {"deregister it again", [&](unsigned& f) { return repo->deregisterWorkspaceService(roads, pub, f); }, 0},
        {"set a property",
         [&](unsigned&) {
             fetched->getPropertyAccessor().setProperty(t("cat"), t("key"), t("value"));
             return fetched->updatePropertyAccessor(fetched->getPropertyAccessor());
         },
         kUntouched},
        {"read it back",
         checking([&](unsigned& f) { return manager->getService(pub, *service, f); },
                  [&] {
                      return service->getPropertyAccessor().getPropertyValue(t("cat"), t("key"), value) &&
                             value.equals("value");
                  }),
         1},
        {"remove", [&](unsigned& f) { return manager->removeService(pub, f); }, 1},
        {"a property of a removed service",
         [&](unsigned&) { return fetched->updatePropertyAccessor(fetched->getPropertyAccessor()); }, kDenied},
        {"remove again", [&](unsigned& f) { return manager->removeService(pub, f); }, 0},
    });
}

}  // namespace
}  // namespace zeltest
