// The elements of the "REP_" reply documents, written from the records of the repository store
// and the items' headers.
#include "repository_xml.h"

#include "server.h"

namespace zelserverd {

namespace {

using Node = pugi::xml_node;

void attr(Node node, const char* name, const std::string& value) { node.append_attribute(name) = value.c_str(); }

const char* flag(bool value) { return value ? "true" : "false"; }

void appendProperties(RepositoryStore& repos, Node parent, const std::string& owner)
{
    for (const auto& p : repos.properties(owner)) {
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

}  // namespace

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

ItemHeader headerOf(RepositoryStore& repos, const ItemRecord& item)
{
    ItemHeader header;
    // Workspace headers were checked on upload; what parses is what there is.
    parseItemHeader(repos.readHead(item.blob), false, header);
    return header;
}

void appendRepository(Node parent, const RepositoryRecord& repo)
{
    Node element = parent.append_child("REPOSITORY");
    attr(element, "name", repo.name);
    attr(element, "description", repo.description);
}

void appendService(RepositoryStore& repos, Node parent, const ServiceRecord& s)
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
    appendProperties(repos, element, "service:" + std::to_string(s.id));
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
void appendWorkspace(RepositoryStore& repos, Node parent, const ItemRecord& item)
{
    ItemHeader h = headerOf(repos, item);
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
            appendProperties(repos, ft, "featuretype:" + featureTypeId);
        }
        appendProperties(repos, ds, "dataset:" + datasetId);
    }
    for (const auto& r : repos.resources(item.id))
        appendResource(ws, r);
    appendProperties(repos, ws, "workspace:" + id);
}

// The custom format, custom transformer and template views share one shape.
void appendCustom(RepositoryStore& repos, Node parent, const char* element, const ItemRecord& item)
{
    ItemHeader h = headerOf(repos, item);
    Node node = parent.append_child(element);
    attr(node, "name", item.name);
    attr(node, "title", h.title);
    attr(node, "description", h.description);
    attr(node, "filesize", std::to_string(item.filesize));
}

void appendGlobalItem(RepositoryStore& repos, Node parent, const ItemRecord& item)
{
    ItemHeader h = headerOf(repos, item);
    Node p = parent.append_child("PROPERTY");
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

void appendFormat(RepositoryStore& r, Node n, const ItemRecord& i) { appendCustom(r, n, "CUSTOMFORMAT", i); }
void appendTransformer(RepositoryStore& r, Node n, const ItemRecord& i) { appendCustom(r, n, "CUSTOMTRANSFORMER", i); }
void appendTemplate(RepositoryStore& r, Node n, const ItemRecord& i) { appendCustom(r, n, "TEMPLATE", i); }

}  // namespace zelserverd
