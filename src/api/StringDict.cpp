#include "api/StringDict.h"

#include "api/ZELServerString.h"

namespace zel {
namespace {

// The connection properties are a handful of keys; the table starts small.
constexpr std::size_t kInitialBuckets = 17;

}  // namespace

// Read through getElement so that keys and values keep embedded NULs, whatever the list's class.
std::string elementBytes(const IZELServerStringArray& list, unsigned index)
{
    ZELServerString value;
    list.getElement(index, value);
    return value.str();
}

StringDict::StringDict() : entries_(kInitialBuckets) {}

StringDict::StringDict(const IZELServerStringArray& pairs) : StringDict()
{
    forEachPair(pairs,
                [this](std::string key, std::string value) { entries_.try_emplace(std::move(key), std::move(value)); });
}

bool StringDict::insert(const std::string& key, const std::string& value)
{
    return entries_.try_emplace(key, value).second;
}

const std::string* StringDict::find(const std::string& key) const
{
    const auto it = entries_.find(key);
    return it == entries_.end() ? nullptr : &it->second;
}

void insertPairs(const IZELServerStringArray& pairs, ZELServerStringDict& into)
{
    forEachPair(pairs, [&into](const std::string& key, const std::string& value) { into.insert(key, value); });
}

ZELServerStringDict toStringDict(const IZELServerStringArray& pairs)
{
    ZELServerStringDict dict;
    insertPairs(pairs, dict);
    return dict;
}

void appendPairs(const ZELServerStringDict& dict, IZELServerStringArray& out)
{
    for (const auto& [key, value] : dict) {
        out.append(ZELServerString(key));
        out.append(ZELServerString(value));
    }
}

}  // namespace zel
