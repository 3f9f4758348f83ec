#include "api/ZELServerStringArray.h"

#include <algorithm>
#include <cstring>
#include <string_view>

#include "api/ZELServerString.h"
#include "api/exception_guard.h"

namespace zel {

ZELServerStringArray& ZELServerStringArray::operator=(const ZELServerStringArray& other)
{
    elements_ = other.elements_;
    return *this;
}

void ZELServerStringArray::append(const IZELServerString& value)
{
    guarded([&] { elements_.push_back(toStdString(value)); });
}

void ZELServerStringArray::append(const char* value)
{
    guarded([&] { elements_.emplace_back(value ? value : ""); });
}

const char* ZELServerStringArray::element(unsigned index) const
{
    return index < elements_.size() ? elements_[index].c_str() : "";
}

int ZELServerStringArray::getElement(unsigned index, IZELServerString& out) const
{
    return guarded([&] {
        if (index < elements_.size()) {
            copyText(elements_[index], out);
        }
        return 0;
    });
}

int ZELServerStringArray::setElement(unsigned index, const IZELServerString& value)
{
    return guarded([&] {
        if (index < elements_.size()) {
            elements_[index] = toStdString(value);
        }
        return 0;
    });
}

bool ZELServerStringArray::contains(const IZELServerString& value) const
{
    return guarded([&] { return containsBytes(toStdString(value)); });
}

bool ZELServerStringArray::contains(const char* value) const
{
    return guarded([&] { return containsBytes(value ? value : ""); });
}

void ZELServerStringArray::appendTokens(const char* text, const char* delimiter)
{
    guarded([&] {
        if (text == nullptr || *text == '\0') {
            return;
        }
        if (delimiter == nullptr || *delimiter == '\0') {
            elements_.emplace_back(text);
            return;
        }
        const std::string_view rest(text);
        std::size_t start = 0;
        for (;;) {
            const std::size_t end = rest.find(*delimiter, start);
            if (end == std::string_view::npos) {
                elements_.emplace_back(rest.substr(start));
                return;
            }
            elements_.emplace_back(rest.substr(start, end - start));
            start = end + 1;
        }
    });
}

void ZELServerStringArray::appendTokensAnyOf(const char* text, const char* delimiters)
{
    guarded([&] {
        if (text == nullptr) {
            return;
        }
        const std::string_view rest(text);
        const std::string_view set(delimiters ? delimiters : "");
        std::size_t start = rest.find_first_not_of(set);
        while (start != std::string_view::npos) {
            const std::size_t end = rest.find_first_of(set, start);
            elements_.emplace_back(rest.substr(start, end == std::string_view::npos ? end : end - start));
            start = end == std::string_view::npos ? end : rest.find_first_not_of(set, end);
        }
    });
}

unsigned ZELServerStringArray::removeAll(const IZELServerString& value)
{
    return guarded([&] { return removeBytes(toStdString(value)); });
}

unsigned ZELServerStringArray::removeAll(const char* value)
{
    return guarded([&] { return removeBytes(value ? value : ""); });
}

bool ZELServerStringArray::containsBytes(const std::string& value) const
{
    return std::find(elements_.begin(), elements_.end(), value) != elements_.end();
}

unsigned ZELServerStringArray::removeBytes(const std::string& value)
{
    return static_cast<unsigned>(std::erase(elements_, value));
}

}  // namespace zel
