#include "output.h"

#include <algorithm>
#include <ostream>
#include <vector>

namespace zelctl {

std::string plain(const nlohmann::ordered_json& value)
{
    if (value.is_string())
        return value.get<std::string>();
    if (value.is_null())
        return "";
    if (value.is_boolean())
        return value.get<bool>() ? "yes" : "no";
    if (value.is_array()) {
        if (value.empty())
            return "-";
        std::string joined;
        for (const auto& element : value)
            joined += (joined.empty() ? "" : ", ") + plain(element);
        return joined;
    }
    return value.dump();
}

void Output::print(const nlohmann::ordered_json& value)
{
    if (json_)
        // Server texts are not promised to be UTF-8; a stray byte must not cost the whole answer.
        out_ << value.dump(2, ' ', false, nlohmann::ordered_json::error_handler_t::replace) << '\n';
    else
        human(value, "");
    out_.flush();
}

void Output::done(const char* verb, const nlohmann::ordered_json& subject)
{
    if (!json_ && quiet_)
        return;
    nlohmann::ordered_json value = {{"done", verb}};
    value.update(subject);
    print(value);
}

namespace {

// A key as people read it: "client address" for client_address.
std::string label(std::string key)
{
    std::replace(key.begin(), key.end(), '_', ' ');
    return key;
}

bool isTable(const nlohmann::ordered_json& value)
{
    return value.is_array() && !value.empty() && value.front().is_object();
}

}  // namespace

void Output::human(const nlohmann::ordered_json& value, const std::string& indent)
{
    if (isTable(value)) {
        table(value, indent);
    } else if (value.is_array()) {
        for (const auto& element : value)
            out_ << indent << plain(element) << '\n';
    } else if (value.is_object()) {
        for (const auto& [key, element] : value.items()) {
            if (isTable(element) || element.is_object()) {
                out_ << indent << label(key) << ":\n";
                human(element, indent + "  ");
            } else {
                out_ << indent << label(key) << ": " << plain(element) << '\n';
            }
        }
    } else {
        out_ << indent << plain(value) << '\n';
    }
}

void Output::table(const nlohmann::ordered_json& rows, const std::string& indent)
{
    // Columns in the order the first row names them; later rows may add more.
    std::vector<std::string> columns;
    for (const auto& row : rows)
        for (const auto& [key, _] : row.items())
            if (std::find(columns.begin(), columns.end(), key) == columns.end())
                columns.push_back(key);
    std::vector<std::size_t> widths;
    for (const std::string& column : columns) {
        std::size_t width = column.size();
        for (const auto& row : rows)
            width = std::max(width, plain(row.value(column, nlohmann::ordered_json())).size());
        widths.push_back(width);
    }
    auto line = [&](auto cell) {
        std::string text = indent;
        for (std::size_t i = 0; i < columns.size(); ++i) {
            std::string value = cell(i);
            if (i + 1 < columns.size())
                value.resize(widths[i] + 2, ' ');
            text += value;
        }
        while (!text.empty() && text.back() == ' ')
            text.pop_back();
        out_ << text << '\n';
    };
    std::vector<std::string> upper;
    for (const std::string& column : columns) {
        std::string heading = label(column);
        std::transform(heading.begin(), heading.end(), heading.begin(),
                       [](unsigned char c) { return std::toupper(c); });
        upper.push_back(heading);
    }
    line([&](std::size_t i) { return upper[i]; });
    for (const auto& row : rows)
        line([&](std::size_t i) { return plain(row.value(columns[i], nlohmann::ordered_json())); });
}

}  // namespace zelctl
