// The header that describes a repository item: "# @key value" comment lines at the top of the
// file. A workspace (".zlw") is a shell script whose header declares its title, published
// parameters, datasets and feature types; docs/zelserverd.md describes the format. Other items
// may carry the same descriptive keys.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace zelserverd {

// Only this much of a file is read for its header.
constexpr std::size_t kMaxHeaderBytes = 65536;

struct HeaderParameter {
    std::string name;  // a shell identifier: it becomes an environment variable of the job
    std::string type = "TEXT";
    std::string defaultValue;
    std::string description;
    std::string optionsType;
    std::string options;  // choices separated by "%"
};

struct HeaderAttribute {
    std::string name;
    std::string type;
    std::uint32_t width = 0;
    std::uint32_t decimals = 0;
};

struct HeaderFeatureType {
    std::string name;
    std::string description;
    std::vector<HeaderAttribute> attributes;
};

struct HeaderDataset {
    bool source = true;
    std::string format;
    std::string name;
    std::string location;
    std::vector<HeaderFeatureType> featureTypes;
};

struct ItemHeader {
    std::string title;
    std::string description;
    std::string category;
    std::string usage;
    std::string history;
    std::string requirements;
    std::string requirementsKeyword;
    std::string legalTerms;
    bool enabled = true;
    std::vector<HeaderParameter> parameters;
    std::vector<HeaderDataset> datasets;

    const HeaderParameter* findParameter(std::string_view name) const;
};

// Parses the header at the start of `text`. Strict (workspaces): any malformed line is an
// error "line N: ...". Lenient (other items): malformed lines are skipped. Empty on success.
std::string parseItemHeader(std::string_view text, bool strict, ItemHeader& out);

// Item kinds, numbered as clients number them; derived from the end of the name, with case.
enum class ItemKind { Other = 0, Workspace = 1, CustomFormat = 2, CustomTransformer = 3, Template = 4 };
ItemKind itemKindOf(std::string_view name);

bool isShellIdentifier(std::string_view name);

}  // namespace zelserverd
