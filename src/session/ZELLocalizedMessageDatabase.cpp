// Catalogue format (UTF-8 text, one entry per line):
//
//   # a comment line; blank lines are ignored too
//   393617 The argument %1 has the invalid value '%2'.
//
// A line is a decimal message number, at least one blank (space or tab), and the text up to the end
// of the line (a carriage return before the line feed is dropped; leading blanks of the text are
// not part of it). In the text, %1 to %9 are parameter slots filled with the first to ninth
// parameter, and %% is a literal percent sign; a percent sign followed by anything else stays as it
// is. A number may appear only once. Any other line makes the whole catalogue unreadable, so that a
// damaged file is noticed at once instead of leaving some messages silently without text.

#include "session/ZELLocalizedMessageDatabase.h"

#include <cstdio>
#include <limits>
#include <memory>

#include "platform/environment.h"

namespace zel {
namespace {

bool isBlank(char c) { return c == ' ' || c == '\t'; }
bool isDigit(char c) { return c >= '0' && c <= '9'; }

std::string cataloguePath(const std::string& homeDirectory)
{
    std::string path = homeDirectory;
    if (!path.empty() && path.back() != platform::kPathSeparator && path.back() != '/') {
        path += platform::kPathSeparator;
    }
    return path + ZELLocalizedMessageDatabase::kCatalogueFolder + platform::kPathSeparator +
           ZELLocalizedMessageDatabase::kCatalogueFile;
}

// Reads the leading number of a catalogue line; false when there are no digits or it overflows.
bool readNumber(std::string_view line, std::size_t& position, unsigned& number)
{
    const std::size_t start = position;
    unsigned long long value = 0;
    while (position < line.size() && isDigit(line[position])) {
        value = value * 10 + static_cast<unsigned>(line[position] - '0');
        if (value > std::numeric_limits<unsigned>::max()) {
            return false;
        }
        ++position;
    }
    number = static_cast<unsigned>(value);
    return position > start;
}

// A folder of the catalogue's name opens on some systems and fails only when read: the read error
// is what counts.
bool readWholeFile(const std::string& path, std::string& content)
{
    std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "rb"), &std::fclose);
    if (!file) {
        return false;
    }
    char buffer[4096];
    std::size_t count = 0;
    while ((count = std::fread(buffer, 1, sizeof buffer, file.get())) > 0) {
        content.append(buffer, count);
    }
    return std::ferror(file.get()) == 0;
}

}  // namespace

bool ZELLocalizedMessageDatabase::fail(std::string message)
{
    lastError_ = std::move(message);
    return false;
}

bool ZELLocalizedMessageDatabase::initialize(const std::string& homeDirectory)
{
    const std::string path = cataloguePath(homeDirectory);
    std::string content;
    if (!readWholeFile(path, content)) {
        texts_.clear();
        return fail("Cannot read the message catalogue " + path);
    }
    return load(content, path);
}

bool ZELLocalizedMessageDatabase::load(std::string_view text, const std::string& origin)
{
    texts_.clear();
    origin_ = origin;
    lastError_.clear();
    std::map<unsigned, std::string> texts;
    unsigned lineNumber = 0;
    std::size_t lineStart = 0;
    while (lineStart <= text.size()) {
        std::size_t lineEnd = text.find('\n', lineStart);
        if (lineEnd == std::string_view::npos) {
            lineEnd = text.size();
        }
        std::string_view line = text.substr(lineStart, lineEnd - lineStart);
        lineStart = lineEnd + 1;
        ++lineNumber;
        if (!line.empty() && line.back() == '\r') {
            line.remove_suffix(1);
        }

        std::size_t position = 0;
        while (position < line.size() && isBlank(line[position])) {
            ++position;
        }
        if (position == line.size() || line[position] == '#') {
            continue;
        }
        const std::string where = origin + ":" + std::to_string(lineNumber) + ": ";
        unsigned number = 0;
        if (!readNumber(line, position, number) || position == line.size() || !isBlank(line[position])) {
            return fail(where + "expected a message number, a blank and a text");
        }
        while (position < line.size() && isBlank(line[position])) {
            ++position;
        }
        if (position == line.size()) {
            return fail(where + "message " + std::to_string(number) + " has no text");
        }
        if (!texts.emplace(number, std::string(line.substr(position))).second) {
            return fail(where + "message " + std::to_string(number) + " appears twice");
        }
    }
    texts_ = std::move(texts);
    return true;
}

bool ZELLocalizedMessageDatabase::createFilledInMessage(unsigned number, const IZELStringArray* parameters,
                                                        IZELString* output, bool keepUnfilledSlots, bool showNumbers)
{
    const auto found = texts_.find(number);
    if (found == texts_.end()) {
        return fail("Message " + std::to_string(number) + " is not in the message catalogue " + origin_);
    }
    const unsigned available = parameters != nullptr ? parameters->entries() : 0;
    const std::string& pattern = found->second;
    std::string filled = showNumbers ? std::to_string(number) + ": " : std::string();
    for (std::size_t i = 0; i < pattern.size(); ++i) {
        const char c = pattern[i];
        const char next = i + 1 < pattern.size() ? pattern[i + 1] : '\0';
        if (c != '%' || (next != '%' && (next < '1' || next > '9'))) {
            filled += c;
            continue;
        }
        ++i;
        if (next == '%') {
            filled += '%';
            continue;
        }
        const unsigned slot = static_cast<unsigned>(next - '1');
        if (slot < available) {
            const char* value = parameters->element(slot);
            filled += value != nullptr ? value : "";
        } else if (keepUnfilledSlots) {
            filled += '%';
            filled += next;
        }
    }
    if (output != nullptr) {
        output->set(filled.data(), static_cast<unsigned>(filled.size()));
    }
    lastError_.clear();
    return true;
}

}  // namespace zel
