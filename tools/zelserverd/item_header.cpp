#include "item_header.h"

#include "util.h"

namespace zelserverd {

namespace {

bool endsWith(std::string_view text, std::string_view suffix)
{
    return text.size() >= suffix.size() && text.substr(text.size() - suffix.size()) == suffix;
}

// Fields of a structured line are separated by "|"; missing trailing fields stay empty.
std::vector<std::string> fields(std::string_view rest)
{
    std::vector<std::string> parts = split(rest, '|');
    for (auto& part : parts)
        part = trim(part);
    return parts;
}

class HeaderParser {
public:
    explicit HeaderParser(ItemHeader& out) : out_(out) {}

    // Empty, or the error of this line (strict mode reports it, lenient mode drops the line).
    std::string line(const std::string& key, const std::string& rest)
    {
        if (key == "title")
            return set(out_.title, rest);
        if (key == "description") {
            out_.description += (out_.description.empty() ? "" : "\n") + rest;
            return {};
        }
        if (key == "category")
            return set(out_.category, rest);
        if (key == "usage")
            return set(out_.usage, rest);
        if (key == "history")
            return set(out_.history, rest);
        if (key == "requirements")
            return set(out_.requirements, rest);
        if (key == "requirementskeyword")
            return set(out_.requirementsKeyword, rest);
        if (key == "legalterms")
            return set(out_.legalTerms, rest);
        if (key == "enabled")
            return enabled(rest);
        if (key == "parameter")
            return parameter(fields(rest));
        if (key == "source" || key == "destination")
            return dataset(key == "source", fields(rest));
        if (key == "featuretype")
            return featureType(fields(rest));
        if (key == "attribute")
            return attribute(fields(rest));
        return "unknown key '@" + key + "'";
    }

private:
    static std::string set(std::string& field, const std::string& value)
    {
        field = value;
        return {};
    }

    std::string enabled(const std::string& value)
    {
        if (value != "true" && value != "false")
            return "@enabled takes 'true' or 'false'";
        out_.enabled = value == "true";
        return {};
    }

    std::string parameter(const std::vector<std::string>& f)
    {
        if (f.size() > 6)
            return "@parameter takes at most 6 fields";
        if (!isShellIdentifier(f[0]))
            return "parameter name '" + f[0] + "' is not a shell identifier";
        if (f[0] == "PATH" || f[0] == "HOME" || f[0].rfind("ZEL_", 0) == 0)
            return "parameter name '" + f[0] + "' is reserved for the server";
        if (out_.findParameter(f[0]))
            return "parameter '" + f[0] + "' declared twice";
        HeaderParameter p;
        p.name = f[0];
        if (f.size() > 1 && !f[1].empty())
            p.type = f[1];
        if (f.size() > 2)
            p.defaultValue = f[2];
        if (f.size() > 3)
            p.description = f[3];
        if (f.size() > 4)
            p.optionsType = f[4];
        if (f.size() > 5)
            p.options = f[5];
        out_.parameters.push_back(std::move(p));
        return {};
    }

    std::string dataset(bool source, const std::vector<std::string>& f)
    {
        if (f.size() > 3)
            return "a dataset takes at most 3 fields";
        if (f[0].empty())
            return "a dataset needs a format";
        HeaderDataset d;
        d.source = source;
        d.format = f[0];
        if (f.size() > 1)
            d.name = f[1];
        if (f.size() > 2)
            d.location = f[2];
        out_.datasets.push_back(std::move(d));
        return {};
    }

    std::string featureType(const std::vector<std::string>& f)
    {
        if (out_.datasets.empty())
            return "@featuretype before any @source or @destination";
        if (f.size() > 2)
            return "@featuretype takes at most 2 fields";
        if (f[0].empty())
            return "a feature type needs a name";
        out_.datasets.back().featureTypes.push_back({f[0], f.size() > 1 ? f[1] : "", {}});
        return {};
    }

    std::string attribute(const std::vector<std::string>& f)
    {
        if (out_.datasets.empty() || out_.datasets.back().featureTypes.empty())
            return "@attribute before any @featuretype";
        if (f.size() > 4)
            return "@attribute takes at most 4 fields";
        if (f[0].empty())
            return "an attribute needs a name";
        HeaderAttribute a;
        a.name = f[0];
        if (f.size() > 1)
            a.type = f[1];
        for (std::size_t i = 2; i < f.size(); ++i) {
            if (f[i].empty())
                continue;
            auto n = parseDecimal(f[i], UINT32_MAX);
            if (!n)
                return "attribute width and decimals must be decimal numbers";
            (i == 2 ? a.width : a.decimals) = static_cast<std::uint32_t>(*n);
        }
        out_.datasets.back().featureTypes.back().attributes.push_back(std::move(a));
        return {};
    }

    ItemHeader& out_;
};

}  // namespace

const HeaderParameter* ItemHeader::findParameter(std::string_view name) const
{
    for (const auto& p : parameters)
        if (p.name == name)
            return &p;
    return nullptr;
}

bool isShellIdentifier(std::string_view name)
{
    if (name.empty() || (name[0] >= '0' && name[0] <= '9'))
        return false;
    for (char c : name) {
        bool ok = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_';
        if (!ok)
            return false;
    }
    return true;
}

ItemKind itemKindOf(std::string_view name)
{
    if (endsWith(name, ".zlw"))
        return ItemKind::Workspace;
    if (endsWith(name, ".zds"))
        return ItemKind::CustomFormat;
    if (endsWith(name, ".zlx"))
        return ItemKind::CustomTransformer;
    if (endsWith(name, ".zlwt"))
        return ItemKind::Template;
    return ItemKind::Other;
}

std::string parseItemHeader(std::string_view text, bool strict, ItemHeader& out)
{
    out = ItemHeader{};
    HeaderParser parser(out);
    std::size_t pos = 0;
    for (std::size_t number = 1; pos < text.size(); ++number) {
        std::size_t end = text.find('\n', pos);
        if (end == std::string_view::npos) {
            // A header that runs to the read limit may have been cut in the middle of a line.
            if (text.size() >= kMaxHeaderBytes)
                return strict ? "header longer than " + std::to_string(kMaxHeaderBytes) + " bytes" : std::string();
            end = text.size();
        }
        std::string_view line = text.substr(pos, end - pos);
        pos = end + 1;
        if (!line.empty() && line.back() == '\r')
            line.remove_suffix(1);
        if (number == 1 && line.rfind("#!", 0) == 0)
            continue;
        if (line.empty() || line.front() != '#')
            break;
        std::string body = trim(line.substr(1));
        if (body.empty() || body.front() != '@')
            continue;
        std::size_t space = body.find_first_of(" \t");
        std::string key = toLower(body.substr(1, space == std::string::npos ? space : space - 1));
        std::string rest = space == std::string::npos ? std::string() : trim(body.substr(space));
        std::string error = parser.line(key, rest);
        if (!error.empty() && strict)
            return "line " + std::to_string(number) + ": " + error;
    }
    return {};
}

}  // namespace zelserverd
