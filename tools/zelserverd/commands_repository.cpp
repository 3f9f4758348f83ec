// Repositories, items, resources, views, services, registrations and property accessors: the
// "REP_" commands. Reply documents are named after the command and hold the elements that the
// client's readers look for anywhere in the document.
#include "commands.h"
#include "item_header.h"
#include "server.h"
#include "transfer.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

using Node = pugi::xml_node;

enum class Filter { All, Enabled, Disabled };

void attr(Node node, const char* name, const std::string& value) { node.append_attribute(name) = value.c_str(); }

const char* flag(bool value) { return value ? "true" : "false"; }

std::string kindWord(ItemKind kind)
{
    switch (kind) {
    case ItemKind::Workspace:
        return "WORKSPACE";
    case ItemKind::CustomFormat:
        return "CUSTOMFORMAT";
    case ItemKind::CustomTransformer:
        return "CUSTOMTRANSFORMER";
    case ItemKind::Template:
        return "TEMPLATE";
    case ItemKind::Other:
        break;
    }
    return "OTHER";
}

bool passes(Filter filter, bool enabled) { return filter == Filter::All || (filter == Filter::Enabled) == enabled; }

// How a command names a service, repository or item: not at all, by a name it answers for
// itself when unknown ("false", or a document without the element), or as something that must
// exist.
enum class Named { No, Name, Known };

// What a command names, in the order a request is checked: the first missing value or unknown
// name is the reply.
struct Wants {
    Named service = Named::No;                // "serviceName"
    Named repository = Named::No;             // "repositoryName"
    bool filter = false;                      // "enableFilter", absent meaning all
    Named item = Named::No;                   // `itemValue`, in the repository
    std::string_view itemValue = "itemName";  // "workspaceName" and others for the typed forms
    bool resource = false;                    // "resourceName"
};

// What the names resolved to. A record named by its name alone holds only that name.
struct Target {
    ServiceRecord service;
    RepositoryRecord repository;
    Filter filter = Filter::All;
    ItemRecord item;
    std::string resourceName;
};

// Reads the value `valueName` into `out.name`; a Known one must also be found by `find`, which
// fills `out`, or the command is refused with "unknown <what> '<name>'<where>".
template <typename Record, typename Find>
std::optional<Reply> resolveName(CommandContext& context, Named how, std::string_view valueName, std::string_view what,
                                 const std::string& where, Find find, Record& out)
{
    if (how == Named::No)
        return std::nullopt;
    Reply failure;
    auto name = context.required(valueName, failure);
    if (!name)
        return failure;
    out.name = *name;
    if (how == Named::Name)
        return std::nullopt;
    std::optional<Record> record = find(*name);
    if (!record)
        return Reply::error("unknown " + std::string(what) + " '" + *name + "'" + where);
    out = std::move(*record);
    return std::nullopt;
}

// "enableFilter" as the directives put it on the wire.
std::optional<Reply> resolveFilter(CommandContext& context, Filter& out)
{
    std::string value = context.request.get("enableFilter", "All");
    if (value == "All")
        out = Filter::All;
    else if (value == "Enabled")
        out = Filter::Enabled;
    else if (value == "Disabled")
        out = Filter::Disabled;
    else
        return Reply::error("bad enableFilter '" + value + "' (All, Enabled or Disabled)");
    return std::nullopt;
}

// The one way a handler learns what its request names: the failure reply, or nothing with
// `target` filled.
std::optional<Reply> resolve(CommandContext& context, const Wants& wants, Target& target)
{
    RepositoryStore& repos = context.server.repos;
    if (auto failure = resolveName(
            context, wants.service, "serviceName", "service", "",
            [&](const std::string& name) { return repos.service(name); }, target.service))
        return failure;
    if (auto failure = resolveName(
            context, wants.repository, "repositoryName", "repository", "",
            [&](const std::string& name) { return repos.repository(name); }, target.repository))
        return failure;
    if (wants.filter)
        if (auto failure = resolveFilter(context, target.filter))
            return failure;
    if (auto failure = resolveName(
            context, wants.item, wants.itemValue, "item", " in '" + target.repository.name + "'",
            [&](const std::string& name) { return repos.item(target.repository.name, name); }, target.item))
        return failure;
    if (wants.resource) {
        Reply failure;
        auto name = context.required("resourceName", failure);
        if (!name)
            return failure;
        target.resourceName = *name;
    }
    return std::nullopt;
}

ItemHeader headerOf(CommandContext& context, const ItemRecord& item)
{
    ItemHeader header;
    // Workspace headers were checked on upload; what parses is what there is.
    parseItemHeader(context.server.repos.readHead(item.blob), false, header);
    return header;
}

void appendProperties(CommandContext& context, Node parent, const std::string& owner)
{
    for (const auto& p : context.server.repos.properties(owner)) {
        Node element = parent.append_child("PROPERTY");
        attr(element, "category", p.category);
        attr(element, "name", p.name);
        attr(element, "value", p.value);
        for (const auto& [name, value] : p.attributes) {
            Node a = element.append_child("ATTRIBUTE");
            attr(a, "name", name);
            attr(a, "value", value);
        }
    }
}

void appendRepository(Node parent, const RepositoryRecord& repo)
{
    Node element = parent.append_child("REPOSITORY");
    attr(element, "name", repo.name);
    attr(element, "description", repo.description);
}

void appendService(CommandContext& context, Node parent, const ServiceRecord& s)
{
    Node element = parent.append_child("SERVICE");
    attr(element, "service_id", std::to_string(s.id));
    attr(element, "name", s.name);
    attr(element, "display_name", s.displayName);
    attr(element, "description", s.description);
    attr(element, "url_pattern", s.urlPattern);
    element.append_attribute("is_enabled") = flag(s.enabled);
    element.append_attribute("is_workspace_reg_allowed") = flag(s.workspaceRegistration);
    element.append_attribute("is_customformat_reg_allowed") = flag(s.customFormatRegistration);
    element.append_attribute("is_customtransform_reg_allowed") = flag(s.customTransformerRegistration);
    element.append_attribute("is_template_reg_allowed") = flag(s.templateRegistration);
    appendProperties(context, element, "service:" + std::to_string(s.id));
}

void appendItem(Node parent, const ItemRecord& item, const ItemHeader& h)
{
    Node element = parent.append_child("ITEM");
    attr(element, "name", item.name);
    attr(element, "repository_name", item.repository);
    attr(element, "title", h.title);
    attr(element, "description", h.description);
    attr(element, "filesize", std::to_string(item.filesize));
    attr(element, "category", h.category);
    attr(element, "requirements", h.requirements);
    attr(element, "requirementskeyword", h.requirementsKeyword);
    attr(element, "usage", h.usage);
    attr(element, "history", h.history);
    attr(element, "lastsavedate", item.savedAt);
    attr(element, "lastsavebuild", "zelserverd " + std::string(kServerVersion));
    attr(element, "buildnumber", "0");
    attr(element, "legaltermsconditions", h.legalTerms);
}

void appendSummary(Node parent, const ItemRecord& item, const ItemHeader& h)
{
    Node element = parent.append_child("WORKSPACE_SUMMARY");
    attr(element, "name", item.name);
    attr(element, "title", h.title);
    attr(element, "description", h.description);
    element.append_attribute("is_enabled") = flag(h.enabled);
}

void appendResource(Node parent, const ResourceRecord& r)
{
    Node element = parent.append_child("RESOURCE");
    attr(element, "name", r.name);
    attr(element, "description", "");
    attr(element, "filesize", std::to_string(r.filesize));
}

// Datasets and feature types are numbered by their place in the header: dataset K of item I is
// "I.K", its feature type M is "I.K.M", counting from 1.
void appendWorkspace(CommandContext& context, Node parent, const ItemRecord& item)
{
    ItemHeader h = headerOf(context, item);
    std::string id = std::to_string(item.id);
    Node ws = parent.append_child("WORKSPACE_DEFINITIONS");
    attr(ws, "workspace_id", id);
    attr(ws, "name", item.name);
    attr(ws, "title", h.title);
    attr(ws, "description", h.description);
    ws.append_attribute("is_enabled") = flag(h.enabled);
    attr(ws, "filesize", std::to_string(item.filesize));
    for (const auto& p : h.parameters) {
        Node element = ws.append_child("PARAMETER");
        attr(element, "name", p.name);
        attr(element, "param_type", p.type);
        attr(element, "default_val", p.defaultValue);
        attr(element, "description", p.description);
        attr(element, "options_type", p.optionsType);
        attr(element, "options", p.options);
    }
    for (std::size_t k = 0; k < h.datasets.size(); ++k) {
        const HeaderDataset& d = h.datasets[k];
        std::string datasetId = id + "." + std::to_string(k + 1);
        Node ds = ws.append_child("DATASET");
        attr(ds, "dataset_id", datasetId);
        attr(ds, "format", d.format);
        attr(ds, "name", d.name);
        attr(ds, "location", d.location);
        ds.append_attribute("is_source") = flag(d.source);
        for (std::size_t m = 0; m < d.featureTypes.size(); ++m) {
            const HeaderFeatureType& f = d.featureTypes[m];
            std::string featureTypeId = datasetId + "." + std::to_string(m + 1);
            Node ft = ds.append_child("FEATURE_TYPE");
            attr(ft, "feature_type_id", featureTypeId);
            attr(ft, "name", f.name);
            attr(ft, "description", f.description);
            for (const auto& a : f.attributes) {
                Node element = ft.append_child("ATTRIBUTE");
                attr(element, "name", a.name);
                attr(element, "zel_type", a.type);
                attr(element, "decimals", std::to_string(a.decimals));
                attr(element, "width", std::to_string(a.width));
            }
            appendProperties(context, ft, "featuretype:" + featureTypeId);
        }
        appendProperties(context, ds, "dataset:" + datasetId);
    }
    for (const auto& r : context.server.repos.resources(item.id))
        appendResource(ws, r);
    appendProperties(context, ws, "workspace:" + id);
}

// The custom format, custom transformer and template views share one shape.
void appendCustom(CommandContext& context, Node parent, const char* element, const ItemRecord& item)
{
    ItemHeader h = headerOf(context, item);
    Node node = parent.append_child(element);
    attr(node, "name", item.name);
    attr(node, "title", h.title);
    attr(node, "description", h.description);
    attr(node, "filesize", std::to_string(item.filesize));
}

// ---- repositories -------------------------------------------------------------------------

Reply repositoryExists(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Name}, t))
        return *failure;
    return Reply::boolean(context.server.repos.repository(t.repository.name).has_value());
}

Reply getRepositories(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.filter = true}, t))
        return *failure;
    return Reply::ok(replyDocument("REP_GET_REPOSITORIES", [&](Node root) {
        for (const auto& repo : context.server.repos.repositories())
            appendRepository(root, repo);
    }));
}

Reply getRepository(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Name}, t))
        return *failure;
    auto repo = context.server.repos.repository(t.repository.name);
    // Unknown: a document without the element, which clients read as "not found".
    return Reply::ok(replyDocument("REP_GET_REPOSITORY", [&](Node root) {
        if (repo)
            appendRepository(root, *repo);
    }));
}

Reply addRepository(CommandContext& context)
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

Reply removeRepository(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Name}, t))
        return *failure;
    return Reply::boolean(context.server.repos.removeRepository(t.repository.name));
}

Reply globalItems(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.filter = true}, t))
        return *failure;
    // One property per item: the repository is the category, the item the name, its kind the
    // value; the details are the property's attributes.
    return Reply::ok(replyDocument("REP_GLOBAL_GET_ALL_ITEMS", [&](Node root) {
        for (const auto& item : context.server.repos.allItems()) {
            ItemHeader h = headerOf(context, item);
            Node p = root.append_child("PROPERTY");
            attr(p, "category", item.repository);
            attr(p, "name", item.name);
            attr(p, "value", kindWord(itemKindOf(item.name)));
            for (auto [name, value] : {std::pair<const char*, std::string>{"title", h.title},
                                       {"description", h.description},
                                       {"filesize", std::to_string(item.filesize)},
                                       {"lastsavedate", item.savedAt}}) {
                Node a = p.append_child("ATTRIBUTE");
                attr(a, "name", name);
                attr(a, "value", value);
            }
        }
    }));
}

// ---- items and resources ----------------------------------------------------------------

Reply itemExists(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Known, .item = Named::Name}, t))
        return *failure;
    return Reply::boolean(context.server.repos.item(t.repository.name, t.item.name).has_value());
}

// Reads the head of a received file to check a workspace's header before it is stored.
std::string checkWorkspaceContent(int fd)
{
    ItemHeader header;
    std::string error = parseItemHeader(readHeadOf(fd), true, header);
    return error.empty() ? error : "bad workspace header: " + error;
}

Reply putItem(CommandContext& context, bool replace)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Known, .item = Named::Name}, t))
        return *failure;
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
    bool checkCrc = context.request.get("itemFileCRCCheckingEnabled") == "true";
    UploadResult upload =
        receiveUpload(context.io, context.server.repos.dir(), checkCrc, context.server.config.maxFileBytes);
    if (upload.outcome == TransferOutcome::Lost)
        return Reply::close();
    if (upload.outcome == TransferOutcome::Refused)
        return Reply::error(upload.message);
    if (itemKindOf(name) == ItemKind::Workspace)
        error = checkWorkspaceContent(upload.file.fd());
    if (error.empty())
        error =
            context.server.repos.putItem(repo, name, upload.file, static_cast<std::int64_t>(upload.length), replace);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addItem(CommandContext& context) { return putItem(context, false); }
Reply updateItem(CommandContext& context) { return putItem(context, true); }

Reply sendFile(CommandContext& context, UniqueFd fd, const std::string& what)
{
    if (!fd.valid())
        return Reply::error("cannot open " + what);
    std::string message;
    TransferOutcome outcome = sendDownload(context.io, fd.get(), message);
    if (outcome == TransferOutcome::Lost)
        return Reply::close();
    if (outcome == TransferOutcome::Refused)
        return Reply::error(what + ": " + message);
    return Reply::ok();
}

// A refusal here is one "ERROR" frame in place of the file header, which clients read as
// "no file".
Reply getItem(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Known, .item = Named::Known}, t))
        return *failure;
    return sendFile(context, context.server.repos.openItem(t.repository.name, t.item.name),
                    "item '" + t.item.name + "'");
}

Reply removeItem(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Known, .item = Named::Name}, t))
        return *failure;
    return Reply::boolean(context.server.repos.removeItem(t.repository.name, t.item.name));
}

// The commands on one resource of an item.
constexpr Wants kResource{.repository = Named::Known, .item = Named::Known, .resource = true};

Reply resourceExists(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kResource, t))
        return *failure;
    return Reply::boolean(context.server.repos.resource(t.item.id, t.resourceName).has_value());
}

Reply putResource(CommandContext& context, bool replace)
{
    Target t;
    if (auto failure = resolve(context, kResource, t))
        return *failure;
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
    bool checkCrc = context.request.get("resourceFileCRCCheckingEnabled") == "true";
    UploadResult upload =
        receiveUpload(context.io, context.server.repos.dir(), checkCrc, context.server.config.maxFileBytes);
    if (upload.outcome == TransferOutcome::Lost)
        return Reply::close();
    if (upload.outcome == TransferOutcome::Refused)
        return Reply::error(upload.message);
    error =
        context.server.repos.putResource(item.id, name, upload.file, static_cast<std::int64_t>(upload.length), replace);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addResource(CommandContext& context) { return putResource(context, false); }
Reply updateResource(CommandContext& context) { return putResource(context, true); }

Reply getResource(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kResource, t))
        return *failure;
    return sendFile(context, context.server.repos.openResource(t.item.id, t.resourceName),
                    "resource '" + t.resourceName + "'");
}

Reply removeResource(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kResource, t))
        return *failure;
    return Reply::boolean(context.server.repos.removeResource(t.item.id, t.resourceName));
}

// An absent or unknown resource name gives a document without the element.
Reply resourceView(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Known, .item = Named::Known}, t))
        return *failure;
    auto resource = context.server.repos.resource(t.item.id, context.request.get("resourceName"));
    return Reply::ok(replyDocument("REP_GET_ITEMRESOURCEVIEW", [&](Node root) {
        if (resource)
            appendResource(root, *resource);
    }));
}

Reply resourcesView(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Known, .filter = true, .item = Named::Known}, t))
        return *failure;
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

// The commands that list what a repository holds.
constexpr Wants kRepositoryList{.repository = Named::Known, .filter = true};

Reply summariesView(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kRepositoryList, t))
        return *failure;
    return Reply::ok(replyDocument("REP_GET_WORKSPACESUMMARIESVIEW", [&](Node root) {
        for (const auto& item : itemsOfKind(context, t.repository, ItemKind::Workspace)) {
            ItemHeader h = headerOf(context, item);
            if (passes(t.filter, h.enabled))
                appendSummary(root, item, h);
        }
    }));
}

Reply workspacesView(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kRepositoryList, t))
        return *failure;
    return Reply::ok(replyDocument("REP_GET_WORKSPACESVIEW", [&](Node root) {
        for (const auto& item : itemsOfKind(context, t.repository, ItemKind::Workspace))
            if (passes(t.filter, headerOf(context, item).enabled))
                appendWorkspace(context, root, item);
    }));
}

// One view of a single item of `kind`, named by `valueName`; unknown gives no element.
Reply singleView(CommandContext& context, const char* root, const char* valueName, ItemKind kind,
                 void (*append)(CommandContext&, Node, const ItemRecord&))
{
    Target t;
    if (auto failure = resolve(context, {.repository = Named::Known, .item = Named::Name, .itemValue = valueName}, t))
        return *failure;
    auto item = context.server.repos.item(t.repository.name, t.item.name);
    return Reply::ok(replyDocument(root, [&](Node node) {
        if (item && itemKindOf(item->name) == kind)
            append(context, node, *item);
    }));
}

Reply listView(CommandContext& context, const char* root, ItemKind kind,
               void (*append)(CommandContext&, Node, const ItemRecord&))
{
    Target t;
    if (auto failure = resolve(context, kRepositoryList, t))
        return *failure;
    return Reply::ok(replyDocument(root, [&](Node node) {
        for (const auto& item : itemsOfKind(context, t.repository, kind))
            append(context, node, item);
    }));
}

void appendFormat(CommandContext& c, Node n, const ItemRecord& i) { appendCustom(c, n, "CUSTOMFORMAT", i); }
void appendTransformer(CommandContext& c, Node n, const ItemRecord& i) { appendCustom(c, n, "CUSTOMTRANSFORMER", i); }
void appendTemplate(CommandContext& c, Node n, const ItemRecord& i) { appendCustom(c, n, "TEMPLATE", i); }

Reply workspaceView(CommandContext& c)
{
    return singleView(c, "REP_GET_WORKSPACEVIEW", "workspaceName", ItemKind::Workspace, appendWorkspace);
}
Reply formatsView(CommandContext& c)
{
    return listView(c, "REP_GET_CUSTOMFORMATSVIEW", ItemKind::CustomFormat, appendFormat);
}
Reply formatView(CommandContext& c)
{
    return singleView(c, "REP_GET_CUSTOMFORMATVIEW", "customFormatName", ItemKind::CustomFormat, appendFormat);
}
Reply transformersView(CommandContext& c)
{
    return listView(c, "REP_GET_CUSTOMTRANSFORMERSVIEW", ItemKind::CustomTransformer, appendTransformer);
}
Reply transformerView(CommandContext& c)
{
    return singleView(c, "REP_GET_CUSTOMTRANSFORMERVIEW", "customTransformerName", ItemKind::CustomTransformer,
                      appendTransformer);
}
Reply templatesView(CommandContext& c)
{
    return listView(c, "REP_GET_TEMPLATESVIEW", ItemKind::Template, appendTemplate);
}
Reply templateView(CommandContext& c)
{
    return singleView(c, "REP_GET_TEMPLATEVIEW", "templateName", ItemKind::Template, appendTemplate);
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

Reply serviceExists(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.service = Named::Name}, t))
        return *failure;
    return Reply::boolean(context.server.repos.service(t.service.name).has_value());
}

Reply getServices(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.filter = true}, t))
        return *failure;
    return Reply::ok(replyDocument("REP_GET_SERVICES", [&](Node root) {
        for (const auto& s : context.server.repos.services())
            if (passes(t.filter, s.enabled))
                appendService(context, root, s);
    }));
}

Reply getService(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.service = Named::Name}, t))
        return *failure;
    auto service = context.server.repos.service(t.service.name);
    return Reply::ok(replyDocument("REP_GET_SERVICE", [&](Node root) {
        if (service)
            appendService(context, root, *service);
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

Reply addService(CommandContext& context) { return putService(context, false); }
Reply updateService(CommandContext& context) { return putService(context, true); }

Reply removeService(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.service = Named::Name}, t))
        return *failure;
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

// Registration commands name a service, a repository and an item of it.
constexpr Wants kItemRegistration{.service = Named::Known, .repository = Named::Known, .item = Named::Known};
constexpr Wants kWorkspaceRegistration{
    .service = Named::Known, .repository = Named::Known, .item = Named::Known, .itemValue = "workspaceName"};

Reply isRegistered(CommandContext& context, const Wants& wants)
{
    Target t;
    if (auto failure = resolve(context, wants, t))
        return *failure;
    return Reply::boolean(context.server.repos.registered(t.service.id, t.item.id));
}

Reply itemRegistered(CommandContext& context) { return isRegistered(context, kItemRegistration); }
Reply workspaceServiceExists(CommandContext& context) { return isRegistered(context, kWorkspaceRegistration); }

Reply registerItem(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kItemRegistration, t))
        return *failure;
    std::string error = registerWith(context, t.service, t.item);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply deregisterItem(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kItemRegistration, t))
        return *failure;
    return Reply::boolean(context.server.repos.deregisterItem(t.service.id, t.item.id));
}

Reply registerWorkspace(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kWorkspaceRegistration, t))
        return *failure;
    if (itemKindOf(t.item.name) != ItemKind::Workspace)
        return Reply::error("'" + t.item.name + "' is not a workspace");
    std::string error = registerWith(context, t.service, t.item);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply deregisterWorkspace(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kWorkspaceRegistration, t))
        return *failure;
    if (itemKindOf(t.item.name) != ItemKind::Workspace)
        return Reply::error("'" + t.item.name + "' is not a workspace");
    return Reply::boolean(context.server.repos.deregisterItem(t.service.id, t.item.id));
}

// The registrations of the repository's workspaces, filtered by whether the service is
// enabled, and to one workspace when "workspaceName" is given.
Reply workspaceServices(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, kRepositoryList, t))
        return *failure;
    const std::string* only = context.request.find("workspaceName");
    auto& repos = context.server.repos;
    return Reply::ok(replyDocument("REP_GET_WORKSPACESERVICES", [&](Node root) {
        for (const auto& item : itemsOfKind(context, t.repository, ItemKind::Workspace)) {
            if (only && item.name != *only)
                continue;
            ItemHeader h = headerOf(context, item);
            for (std::int64_t serviceId : repos.servicesOfItem(item.id)) {
                auto service = repos.serviceById(serviceId);
                if (!service || !passes(t.filter, service->enabled))
                    continue;
                Node pair = root.append_child("WORKSPACE_SERVICE");
                appendSummary(pair, item, h);
                appendService(context, pair, *service);
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

Reply registeredItems(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.service = Named::Known}, t))
        return *failure;
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
                appendItem(root, item, headerOf(context, item));
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
    ItemHeader h = headerOf(context, *item);
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

Reply serviceAccessor(CommandContext& c) { return updateAccessor(c, "serviceID", 0); }
Reply workspaceAccessor(CommandContext& c) { return updateAccessor(c, "workspaceID", 1); }
Reply datasetAccessor(CommandContext& c) { return updateAccessor(c, "datasetID", 2); }
Reply featureTypeAccessor(CommandContext& c) { return updateAccessor(c, "featureTypeID", 3); }

}  // namespace

std::vector<CommandSpec> repositoryCommands()
{
    constexpr std::uint32_t read = kRightRepositoryRead;
    constexpr std::uint32_t write = kRightRepositoryWrite;
    constexpr std::uint32_t admin = kRightRepositoryAdmin;
    return {
        {"REP_REPOSITORYEXISTS", read, repositoryExists},
        {"REP_GET_REPOSITORIES", read, getRepositories},
        {"REP_GET_REPOSITORY", read, getRepository},
        {"REP_ADD_REPOSITORY", admin, addRepository},
        {"REP_REMOVE_REPOSITORY", admin, removeRepository},
        {"REP_GLOBAL_GET_ALL_ITEMS", read, globalItems},
        {"REP_ITEMEXISTS", read, itemExists},
        {"REP_GET_ITEM", read, getItem},
        {"REP_ADD_ITEM", write, addItem},
        {"REP_UPDATE_ITEM", write, updateItem},
        {"REP_REMOVE_ITEM", write, removeItem},
        {"REP_ITEMRESOURCEEXISTS", read, resourceExists},
        {"REP_GET_ITEMRESOURCE", read, getResource},
        {"REP_ADD_ITEMRESOURCE", write, addResource},
        {"REP_UPDATE_ITEMRESOURCE", write, updateResource},
        {"REP_REMOVE_ITEMRESOURCE", write, removeResource},
        {"REP_GET_ITEMRESOURCEVIEW", read, resourceView},
        {"REP_GET_ITEMRESOURCESVIEW", read, resourcesView},
        {"REP_GET_WORKSPACESUMMARIESVIEW", read, summariesView},
        {"REP_GET_WORKSPACESVIEW", read, workspacesView},
        {"REP_GET_WORKSPACEVIEW", read, workspaceView},
        {"REP_GET_CUSTOMFORMATSVIEW", read, formatsView},
        {"REP_GET_CUSTOMFORMATVIEW", read, formatView},
        {"REP_GET_CUSTOMTRANSFORMERSVIEW", read, transformersView},
        {"REP_GET_CUSTOMTRANSFORMERVIEW", read, transformerView},
        {"REP_GET_TEMPLATESVIEW", read, templatesView},
        {"REP_GET_TEMPLATEVIEW", read, templateView},
        {"REP_GET_WORKSPACESERVICES", read, workspaceServices},
        {"REP_WORKSPACESERVICEEXISTS", read, workspaceServiceExists},
        {"REP_REGISTER_WORKSPACESERVICE", write, registerWorkspace},
        {"REP_DEREGISTER_WORKSPACESERVICE", write, deregisterWorkspace},
        {"REP_SERVICEEXISTS", read, serviceExists},
        {"REP_GET_SERVICES", read, getServices},
        {"REP_GET_SERVICE", read, getService},
        {"REP_ADD_SERVICE", admin, addService},
        {"REP_UPDATE_SERVICE", admin, updateService},
        {"REP_REMOVE_SERVICE", admin, removeService},
        {"REP_ITEMREGISTERED", read, itemRegistered},
        {"REP_REGISTERITEM", write, registerItem},
        {"REP_DEREGISTERITEM", write, deregisterItem},
        {"REP_GET_REGISTEREDITEMS", read, registeredItems},
        {"REP_UPDATE_SERVICEPROPERTYACCESSOR", write, serviceAccessor},
        {"REP_UPDATE_WORKSPACEPROPERTYACCESSOR", write, workspaceAccessor},
        {"REP_UPDATE_DATASETPROPERTYACCESSOR", write, datasetAccessor},
        {"REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", write, featureTypeAccessor},
    };
}

}  // namespace zelserverd
