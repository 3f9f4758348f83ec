// Repositories, items, resources, views, services, registrations and property accessors: the
// "REP_" commands. Reply documents are named after the command and hold the elements that the
// client's readers look for anywhere in the document.
#include "commands.h"
#include "item_header.h"
#include "repository_xml.h"
#include "server.h"
#include "transfer.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

using Node = pugi::xml_node;

bool passes(Filter filter, bool enabled) { return filter == Filter::All || (filter == Filter::Enabled) == enabled; }

// ---- repositories -------------------------------------------------------------------------

Reply repositoryExists(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.repository(t.repository.name).has_value());
}

Reply getRepositories(CommandContext& context, const Target& t)
{
    return Reply::ok(replyDocument("REP_GET_REPOSITORIES", [&](Node root) {
        for (const auto& repo : context.server.repos.repositories())
            appendRepository(root, repo);
    }));
}

Reply getRepository(CommandContext& context, const Target& t)
{
    auto repo = context.server.repos.repository(t.repository.name);
    // Unknown: a document without the element, which clients read as "not found".
    return Reply::ok(replyDocument("REP_GET_REPOSITORY", [&](Node root) {
        if (repo)
            appendRepository(root, *repo);
    }));
}

Reply addRepository(CommandContext& context, const Target&)
{
    Reply failure;
    auto text = context.required("repositoryObject", failure);
    if (!text)
        return failure;
    pugi::xml_document doc;
    std::string error = parseXml(*text, doc);
    if (!error.empty())
        return Reply::error("repositoryObject: " + error);
    Node element = findElement(doc, "REPOSITORY");
    if (!element)
        return Reply::error("repositoryObject holds no REPOSITORY element");
    RepositoryRecord repo{element.attribute("name").value(), element.attribute("description").value()};
    error = checkName("repository", repo.name);
    if (error.empty())
        error = context.server.repos.addRepository(repo);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply removeRepository(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.removeRepository(t.repository.name));
}

Reply globalItems(CommandContext& context, const Target& t)
{
    // One property per item: the repository is the category, the item the name, its kind the
    // value; the details are the property's attributes.
    return Reply::ok(replyDocument("REP_GLOBAL_GET_ALL_ITEMS", [&](Node root) {
        for (const auto& item : context.server.repos.allItems())
            appendGlobalItem(context.server.repos, root, item);
    }));
}

// ---- items and resources ----------------------------------------------------------------

Reply itemExists(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.item(t.repository.name, t.item.name).has_value());
}

// Reads the head of a received file to check a workspace's header before it is stored.
std::string checkWorkspaceContent(int fd)
{
    ItemHeader header;
    std::string error = parseItemHeader(readHeadOf(fd), true, header);
    return error.empty() ? error : "bad workspace header: " + error;
}

Reply putItem(CommandContext& context, const Target& t, bool replace)
{
    const std::string& repo = t.repository.name;
    const std::string& name = t.item.name;
    std::string error = checkName("item", name);
    if (!error.empty())
        return Reply::error(error);
    // Refused before the transfer starts when it is clear already; checked again on commit.
    bool exists = context.server.repos.item(repo, name).has_value();
    if (exists != replace)
        return Reply::error("item '" + name + (exists ? "' already exists" : "' does not exist") + " in '" + repo +
                            "'");
    UploadResult upload;
    if (auto failure = receiveCommandUpload(context, "itemFileCRCCheckingEnabled", upload))
        return *failure;
    if (itemKindOf(name) == ItemKind::Workspace)
        error = checkWorkspaceContent(upload.file.fd());
    if (error.empty())
        error =
            context.server.repos.putItem(repo, name, upload.file, static_cast<std::int64_t>(upload.length), replace);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addItem(CommandContext& context, const Target& t) { return putItem(context, t, false); }
Reply updateItem(CommandContext& context, const Target& t) { return putItem(context, t, true); }

Reply sendFile(CommandContext& context, UniqueFd fd, const std::string& what)
{
    if (!fd.valid())
        return Reply::error("cannot open " + what);
    return sendCommandDownload(context, fd.get(), what + ": ");
}

// A refusal here is one "ERROR" frame in place of the file header, which clients read as
// "no file".
Reply getItem(CommandContext& context, const Target& t)
{
    return sendFile(context, context.server.repos.openItem(t.repository.name, t.item.name),
                    "item '" + t.item.name + "'");
}

Reply removeItem(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.removeItem(t.repository.name, t.item.name));
}

Reply resourceExists(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.resource(t.item.id, t.resourceName).has_value());
}

Reply putResource(CommandContext& context, const Target& t, bool replace)
{
    const ItemRecord& item = t.item;
    const std::string& name = t.resourceName;
    std::string error = checkName("resource", name);
    if (!error.empty())
        return Reply::error(error);
    if (name == item.name)
        return Reply::error("a resource cannot have the name of its item");
    bool exists = context.server.repos.resource(item.id, name).has_value();
    if (exists != replace)
        return Reply::error("resource '" + name + (exists ? "' already exists" : "' does not exist") + " on '" +
                            item.name + "'");
    UploadResult upload;
    if (auto failure = receiveCommandUpload(context, "resourceFileCRCCheckingEnabled", upload))
        return *failure;
    error =
        context.server.repos.putResource(item.id, name, upload.file, static_cast<std::int64_t>(upload.length), replace);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addResource(CommandContext& context, const Target& t) { return putResource(context, t, false); }
Reply updateResource(CommandContext& context, const Target& t) { return putResource(context, t, true); }

Reply getResource(CommandContext& context, const Target& t)
{
    return sendFile(context, context.server.repos.openResource(t.item.id, t.resourceName),
                    "resource '" + t.resourceName + "'");
}

Reply removeResource(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.removeResource(t.item.id, t.resourceName));
}

// An absent or unknown resource name gives a document without the element.
Reply resourceView(CommandContext& context, const Target& t)
{
    auto resource = context.server.repos.resource(t.item.id, context.request.get("resourceName"));
    return Reply::ok(replyDocument("REP_GET_ITEMRESOURCEVIEW", [&](Node root) {
        if (resource)
            appendResource(root, *resource);
    }));
}

Reply resourcesView(CommandContext& context, const Target& t)
{
    return Reply::ok(replyDocument("REP_GET_ITEMRESOURCESVIEW", [&](Node root) {
        for (const auto& r : context.server.repos.resources(t.item.id))
            appendResource(root, r);
    }));
}

// ---- views ----------------------------------------------------------------------------------

std::vector<ItemRecord> itemsOfKind(CommandContext& context, const RepositoryRecord& repo, ItemKind kind)
{
    std::vector<ItemRecord> out;
    for (auto& item : context.server.repos.items(repo.name))
        if (itemKindOf(item.name) == kind)
            out.push_back(std::move(item));
    return out;
}

Reply summariesView(CommandContext& context, const Target& t)
{
    return Reply::ok(replyDocument("REP_GET_WORKSPACESUMMARIESVIEW", [&](Node root) {
        for (const auto& item : itemsOfKind(context, t.repository, ItemKind::Workspace)) {
            ItemHeader h = headerOf(context.server.repos, item);
            if (passes(t.filter, h.enabled))
                appendSummary(root, item, h);
        }
    }));
}

Reply workspacesView(CommandContext& context, const Target& t)
{
    return Reply::ok(replyDocument("REP_GET_WORKSPACESVIEW", [&](Node root) {
        for (const auto& item : itemsOfKind(context, t.repository, ItemKind::Workspace))
            if (passes(t.filter, headerOf(context.server.repos, item).enabled))
                appendWorkspace(context.server.repos, root, item);
    }));
}

using Append = void (*)(RepositoryStore&, Node, const ItemRecord&);

// One view of a single item of `kind`; an unknown name gives no element.
Reply singleView(CommandContext& context, const Target& t, const char* root, ItemKind kind, Append append)
{
    auto item = context.server.repos.item(t.repository.name, t.item.name);
    return Reply::ok(replyDocument(root, [&](Node node) {
        if (item && itemKindOf(item->name) == kind)
            append(context.server.repos, node, *item);
    }));
}

Reply listView(CommandContext& context, const Target& t, const char* root, ItemKind kind, Append append)
{
    return Reply::ok(replyDocument(root, [&](Node node) {
        for (const auto& item : itemsOfKind(context, t.repository, kind))
            append(context.server.repos, node, item);
    }));
}

Reply workspaceView(CommandContext& c, const Target& t)
{
    return singleView(c, t, "REP_GET_WORKSPACEVIEW", ItemKind::Workspace, appendWorkspace);
}
Reply formatsView(CommandContext& c, const Target& t)
{
    return listView(c, t, "REP_GET_CUSTOMFORMATSVIEW", ItemKind::CustomFormat, appendFormat);
}
Reply formatView(CommandContext& c, const Target& t)
{
    return singleView(c, t, "REP_GET_CUSTOMFORMATVIEW", ItemKind::CustomFormat, appendFormat);
}
Reply transformersView(CommandContext& c, const Target& t)
{
    return listView(c, t, "REP_GET_CUSTOMTRANSFORMERSVIEW", ItemKind::CustomTransformer, appendTransformer);
}
Reply transformerView(CommandContext& c, const Target& t)
{
    return singleView(c, t, "REP_GET_CUSTOMTRANSFORMERVIEW", ItemKind::CustomTransformer, appendTransformer);
}
Reply templatesView(CommandContext& c, const Target& t)
{
    return listView(c, t, "REP_GET_TEMPLATESVIEW", ItemKind::Template, appendTemplate);
}
Reply templateView(CommandContext& c, const Target& t)
{
    return singleView(c, t, "REP_GET_TEMPLATEVIEW", ItemKind::Template, appendTemplate);
}

// ---- services ---------------------------------------------------------------------------------

std::optional<bool> parseFlag(std::string_view text)
{
    if (iequals(text, "true") || text == "1")
        return true;
    if (iequals(text, "false") || text == "0" || text.empty())
        return false;
    return std::nullopt;
}

std::string serviceFromDocument(const std::string& text, ServiceRecord& out)
{
    pugi::xml_document doc;
    std::string error = parseXml(text, doc);
    if (!error.empty())
        return "serviceObject: " + error;
    Node e = findElement(doc, "SERVICE");
    if (!e)
        return "serviceObject holds no SERVICE element";
    out.name = e.attribute("name").value();
    out.displayName = e.attribute("display_name").value();
    out.description = e.attribute("description").value();
    out.urlPattern = e.attribute("url_pattern").value();
    std::pair<const char*, bool*> flags[] = {
        {"is_enabled", &out.enabled},
        {"is_workspace_reg_allowed", &out.workspaceRegistration},
        {"is_customformat_reg_allowed", &out.customFormatRegistration},
        {"is_customtransform_reg_allowed", &out.customTransformerRegistration},
        {"is_template_reg_allowed", &out.templateRegistration},
    };
    for (auto [name, target] : flags) {
        auto value = parseFlag(e.attribute(name).value());
        if (!value)
            return std::string("bad value of ") + name + ": '" + e.attribute(name).value() + "'";
        *target = *value;
    }
    // Service names travel as plain request values; they need no file-name rule, only sanity.
    if (out.name.empty())
        return "a service needs a name";
    for (char c : out.name)
        if (static_cast<unsigned char>(c) < 0x20)
            return "service name holds a control character";
    return {};
}

Reply serviceExists(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.service(t.service.name).has_value());
}

Reply getServices(CommandContext& context, const Target& t)
{
    return Reply::ok(replyDocument("REP_GET_SERVICES", [&](Node root) {
        for (const auto& s : context.server.repos.services())
            if (passes(t.filter, s.enabled))
                appendService(context.server.repos, root, s);
    }));
}

Reply getService(CommandContext& context, const Target& t)
{
    auto service = context.server.repos.service(t.service.name);
    return Reply::ok(replyDocument("REP_GET_SERVICE", [&](Node root) {
        if (service)
            appendService(context.server.repos, root, *service);
    }));
}

Reply putService(CommandContext& context, bool update)
{
    Reply failure;
    auto text = context.required("serviceObject", failure);
    if (!text)
        return failure;
    ServiceRecord record;
    std::string error = serviceFromDocument(*text, record);
    // The id a client sends is its own copy's ("-1" for a new object); the name identifies.
    if (error.empty())
        error = update ? context.server.repos.updateService(record) : context.server.repos.addService(record);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addService(CommandContext& context, const Target&) { return putService(context, false); }
Reply updateService(CommandContext& context, const Target&) { return putService(context, true); }

Reply removeService(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.removeService(t.service.name));
}

bool accepts(const ServiceRecord& s, ItemKind kind)
{
    switch (kind) {
    case ItemKind::Workspace:
        return s.workspaceRegistration;
    case ItemKind::CustomFormat:
        return s.customFormatRegistration;
    case ItemKind::CustomTransformer:
        return s.customTransformerRegistration;
    case ItemKind::Template:
        return s.templateRegistration;
    case ItemKind::Other:
        break;
    }
    return false;
}

std::string registerWith(CommandContext& context, const ServiceRecord& s, const ItemRecord& item)
{
    ItemKind kind = itemKindOf(item.name);
    if (!accepts(s, kind))
        return "service '" + s.name + "' does not accept items of kind " + kindWord(kind) + " ('" + item.name + "')";
    if (context.server.repos.registered(s.id, item.id))
        return "'" + item.repository + "/" + item.name + "' is already registered with '" + s.name + "'";
    return context.server.repos.registerItem(s.id, item.id);
}

Reply isRegistered(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.registered(t.service.id, t.item.id));
}

Reply registerItem(CommandContext& context, const Target& t)
{
    std::string error = registerWith(context, t.service, t.item);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply deregisterItem(CommandContext& context, const Target& t)
{
    return Reply::boolean(context.server.repos.deregisterItem(t.service.id, t.item.id));
}

Reply registerWorkspace(CommandContext& context, const Target& t)
{
    if (itemKindOf(t.item.name) != ItemKind::Workspace)
        return Reply::error("'" + t.item.name + "' is not a workspace");
    std::string error = registerWith(context, t.service, t.item);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply deregisterWorkspace(CommandContext& context, const Target& t)
{
    if (itemKindOf(t.item.name) != ItemKind::Workspace)
        return Reply::error("'" + t.item.name + "' is not a workspace");
    return Reply::boolean(context.server.repos.deregisterItem(t.service.id, t.item.id));
}

// The registrations of the repository's workspaces, filtered by whether the service is
// enabled, and to one workspace when "workspaceName" is given.
Reply workspaceServices(CommandContext& context, const Target& t)
{
    const std::string* only = context.request.find("workspaceName");
    auto& repos = context.server.repos;
    return Reply::ok(replyDocument("REP_GET_WORKSPACESERVICES", [&](Node root) {
        for (const auto& item : itemsOfKind(context, t.repository, ItemKind::Workspace)) {
            if (only && item.name != *only)
                continue;
            ItemHeader h = headerOf(context.server.repos, item);
            for (std::int64_t serviceId : repos.servicesOfItem(item.id)) {
                auto service = repos.serviceById(serviceId);
                if (!service || !passes(t.filter, service->enabled))
                    continue;
                Node pair = root.append_child("WORKSPACE_SERVICE");
                appendSummary(pair, item, h);
                appendService(context.server.repos, pair, *service);
            }
        }
    }));
}

std::optional<ItemKind> kindFromText(std::string_view text)
{
    if (auto n = parseDecimal(text, 4))
        return static_cast<ItemKind>(*n);
    for (ItemKind kind : {ItemKind::Other, ItemKind::Workspace, ItemKind::CustomFormat, ItemKind::CustomTransformer,
                          ItemKind::Template})
        if (iequals(text, kindWord(kind)))
            return kind;
    return std::nullopt;
}

Reply registeredItems(CommandContext& context, const Target& t)
{
    std::optional<ItemKind> only;
    if (const std::string* type = context.request.find("itemType")) {
        only = kindFromText(*type);
        if (!only)
            return Reply::error("bad itemType '" + *type +
                                "' (0 to 4, or WORKSPACE, CUSTOMFORMAT, CUSTOMTRANSFORMER, TEMPLATE, "
                                "OTHER)");
    }
    return Reply::ok(replyDocument("REP_GET_REGISTEREDITEMS", [&](Node root) {
        for (const auto& item : context.server.repos.registeredItems(t.service.id))
            if (!only || itemKindOf(item.name) == *only)
                appendItem(root, item, headerOf(context.server.repos, item));
    }));
}

// ---- property accessors -------------------------------------------------------------------

std::string propertiesFromDocument(const std::string& text, std::vector<PropertyRecord>& out)
{
    pugi::xml_document doc;
    std::string error = parseXml(text, doc);
    if (!error.empty())
        return "propertyAccessorObject: " + error;
    for (pugi::xpath_node found : doc.select_nodes("//PROPERTY")) {
        Node e = found.node();
        PropertyRecord p{
            e.attribute("category").value(), e.attribute("name").value(), e.attribute("value").value(), {}};
        if (p.category.empty() || p.name.empty())
            return "a PROPERTY needs a category and a name";
        for (Node a : e.children("ATTRIBUTE"))
            p.attributes.emplace_back(a.attribute("name").value(), a.attribute("value").value());
        out.push_back(std::move(p));
    }
    return {};
}

// "I", "I.K" or "I.K.M": the item id and the dataset and feature type numbers (0 when absent).
struct WorkspacePart {
    std::int64_t item = 0;
    std::size_t dataset = 0;
    std::size_t featureType = 0;
};

std::optional<WorkspacePart> parsePartId(std::string_view text, std::size_t parts)
{
    std::vector<std::string> pieces = split(text, '.');
    if (pieces.size() != parts)
        return std::nullopt;
    std::uint64_t numbers[3] = {0, 0, 0};
    for (std::size_t i = 0; i < parts; ++i) {
        auto n = parseDecimal(pieces[i], INT32_MAX);
        if (!n || *n == 0)
            return std::nullopt;
        numbers[i] = *n;
    }
    return WorkspacePart{static_cast<std::int64_t>(numbers[0]), numbers[1], numbers[2]};
}

// The owner of a workspace, dataset or feature type accessor; `parts` says which.
std::string workspaceOwner(CommandContext& context, std::string_view valueName, std::size_t parts, PropertyOwner& owner)
{
    std::string text = context.request.get(valueName);
    static const char* kinds[] = {"", "workspace", "dataset", "featuretype"};
    auto id = parsePartId(text, parts);
    auto item = id ? context.server.repos.itemById(id->item) : std::nullopt;
    if (!item || itemKindOf(item->name) != ItemKind::Workspace)
        return "unknown " + std::string(kinds[parts]) + " '" + text + "'";
    ItemHeader h = headerOf(context.server.repos, *item);
    bool known = parts == 1 || (id->dataset <= h.datasets.size() &&
                                (parts == 2 || id->featureType <= h.datasets[id->dataset - 1].featureTypes.size()));
    if (!known)
        return "unknown " + std::string(kinds[parts]) + " '" + text + "'";
    owner = PropertyOwner{std::string(kinds[parts]) + ":" + text, item->id, 0};
    return {};
}

Reply updateAccessor(CommandContext& context, std::string_view idName, std::size_t parts)
{
    Reply failure;
    auto text = context.required("propertyAccessorObject", failure);
    if (!text)
        return failure;
    if (!context.required(idName, failure))
        return failure;
    PropertyOwner owner;
    std::string error;
    if (parts == 0) {
        auto id = parseDecimal(context.request.get(idName), INT64_MAX);
        auto service = id ? context.server.repos.serviceById(static_cast<std::int64_t>(*id)) : std::nullopt;
        if (!service)
            return Reply::error("unknown service id '" + context.request.get(idName) + "'");
        owner = PropertyOwner{"service:" + std::to_string(service->id), 0, service->id};
    } else {
        error = workspaceOwner(context, idName, parts, owner);
    }
    std::vector<PropertyRecord> properties;
    if (error.empty())
        error = propertiesFromDocument(*text, properties);
    if (error.empty())
        error = context.server.repos.replaceProperties(owner, properties);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply serviceAccessor(CommandContext& c, const Target&) { return updateAccessor(c, "serviceID", 0); }
Reply workspaceAccessor(CommandContext& c, const Target&) { return updateAccessor(c, "workspaceID", 1); }
Reply datasetAccessor(CommandContext& c, const Target&) { return updateAccessor(c, "datasetID", 2); }
Reply featureTypeAccessor(CommandContext& c, const Target&) { return updateAccessor(c, "featureTypeID", 3); }

}  // namespace

std::vector<CommandSpec> repositoryCommands()
{
    constexpr std::uint32_t read = kRightRepositoryRead;
    constexpr std::uint32_t write = kRightRepositoryWrite;
    constexpr std::uint32_t admin = kRightRepositoryAdmin;
    // What the commands name, by family.
    constexpr Needs repository{.repository = Named::Name};
    constexpr Needs filter{.filter = true};
    constexpr Needs item{.repository = Named::Known, .item = Named::Name};
    constexpr Needs knownItem{.repository = Named::Known, .item = Named::Known};
    constexpr Needs resource{.repository = Named::Known, .item = Named::Known, .resource = true};
    constexpr Needs list{.repository = Named::Known, .filter = true};
    constexpr Needs service{.service = Named::Name};
    constexpr Needs registration{.service = Named::Known, .repository = Named::Known, .item = Named::Known};
    constexpr Needs workspaceRegistration{
        .service = Named::Known, .repository = Named::Known, .item = Named::Known, .itemValue = "workspaceName"};
    auto view = [](std::string_view value) {
        return Needs{.repository = Named::Known, .item = Named::Name, .itemValue = value};
    };
    return {
        {"REP_REPOSITORYEXISTS", read, repository, repositoryExists},
        {"REP_GET_REPOSITORIES", read, filter, getRepositories},
        {"REP_GET_REPOSITORY", read, repository, getRepository},
        {"REP_ADD_REPOSITORY", admin, {}, addRepository},
        {"REP_REMOVE_REPOSITORY", admin, repository, removeRepository},
        {"REP_GLOBAL_GET_ALL_ITEMS", read, filter, globalItems},
        {"REP_ITEMEXISTS", read, item, itemExists},
        {"REP_GET_ITEM", read, knownItem, getItem},
        {"REP_ADD_ITEM", write, item, addItem},
        {"REP_UPDATE_ITEM", write, item, updateItem},
        {"REP_REMOVE_ITEM", write, item, removeItem},
        {"REP_ITEMRESOURCEEXISTS", read, resource, resourceExists},
        {"REP_GET_ITEMRESOURCE", read, resource, getResource},
        {"REP_ADD_ITEMRESOURCE", write, resource, addResource},
        {"REP_UPDATE_ITEMRESOURCE", write, resource, updateResource},
        {"REP_REMOVE_ITEMRESOURCE", write, resource, removeResource},
        {"REP_GET_ITEMRESOURCEVIEW", read, knownItem, resourceView},
        {"REP_GET_ITEMRESOURCESVIEW",
         read,
         {.repository = Named::Known, .filter = true, .item = Named::Known},
         resourcesView},
        {"REP_GET_WORKSPACESUMMARIESVIEW", read, list, summariesView},
        {"REP_GET_WORKSPACESVIEW", read, list, workspacesView},
        {"REP_GET_WORKSPACEVIEW", read, view("workspaceName"), workspaceView},
        {"REP_GET_CUSTOMFORMATSVIEW", read, list, formatsView},
        {"REP_GET_CUSTOMFORMATVIEW", read, view("customFormatName"), formatView},
        {"REP_GET_CUSTOMTRANSFORMERSVIEW", read, list, transformersView},
        {"REP_GET_CUSTOMTRANSFORMERVIEW", read, view("customTransformerName"), transformerView},
        {"REP_GET_TEMPLATESVIEW", read, list, templatesView},
        {"REP_GET_TEMPLATEVIEW", read, view("templateName"), templateView},
        {"REP_GET_WORKSPACESERVICES", read, list, workspaceServices},
        {"REP_WORKSPACESERVICEEXISTS", read, workspaceRegistration, isRegistered},
        {"REP_REGISTER_WORKSPACESERVICE", write, workspaceRegistration, registerWorkspace},
        {"REP_DEREGISTER_WORKSPACESERVICE", write, workspaceRegistration, deregisterWorkspace},
        {"REP_SERVICEEXISTS", read, service, serviceExists},
        {"REP_GET_SERVICES", read, filter, getServices},
        {"REP_GET_SERVICE", read, service, getService},
        {"REP_ADD_SERVICE", admin, {}, addService},
        {"REP_UPDATE_SERVICE", admin, {}, updateService},
        {"REP_REMOVE_SERVICE", admin, service, removeService},
        {"REP_ITEMREGISTERED", read, registration, isRegistered},
        {"REP_REGISTERITEM", write, registration, registerItem},
        {"REP_DEREGISTERITEM", write, registration, deregisterItem},
        {"REP_GET_REGISTEREDITEMS", read, {.service = Named::Known}, registeredItems},
        {"REP_UPDATE_SERVICEPROPERTYACCESSOR", write, {}, serviceAccessor},
        {"REP_UPDATE_WORKSPACEPROPERTYACCESSOR", write, {}, workspaceAccessor},
        {"REP_UPDATE_DATASETPROPERTYACCESSOR", write, {}, datasetAccessor},
        {"REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", write, {}, featureTypeAccessor},
    };
}

}  // namespace zelserverd
