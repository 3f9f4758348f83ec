// Repositories, items, resources, services, registrations and properties. Metadata lives in the
// database; item and resource contents are files in one content directory, each named by a
// random "blob" name that its record holds. New content is received into a temporary file,
// renamed to a fresh blob name, and only then recorded in a transaction; the blob it replaces is
// deleted after the commit. So a record never points at a partial file, and a crash at worst
// leaves an unreferenced file, which the next start deletes.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "net.h"
#include "store.h"
#include "transfer.h"

namespace zelserverd {

struct RepositoryRecord {
    std::string name;
    std::string description;
};

struct ItemRecord {
    std::int64_t id = 0;
    std::string repository;
    std::string name;
    std::string blob;
    std::int64_t filesize = 0;
    std::string savedAt;
};

struct ResourceRecord {
    std::string name;
    std::string blob;
    std::int64_t filesize = 0;
};

struct ServiceRecord {
    std::int64_t id = -1;
    std::string name;
    std::string displayName;
    std::string description;
    std::string urlPattern;
    bool enabled = false;
    bool workspaceRegistration = false;
    bool customFormatRegistration = false;
    bool customTransformerRegistration = false;
    bool templateRegistration = false;
};

struct PropertyRecord {
    std::string category;
    std::string name;
    std::string value;
    std::vector<std::pair<std::string, std::string>> attributes;
};

// The object a set of properties belongs to: `key` is "service:ID", "workspace:ID",
// "dataset:ID" or "featuretype:ID"; the item or service id ties the properties' lifetime to it.
struct PropertyOwner {
    std::string key;
    std::int64_t itemId = 0;
    std::int64_t serviceId = 0;
};

// Names of repositories, items and resources: not empty, at most 255 bytes, no control
// characters and none of \ / : * ? " < > | & = ' + %. Empty when acceptable, else why not.
std::string checkName(std::string_view kind, std::string_view name);

// The first kMaxHeaderBytes of an open file, read from its start without moving its offset.
std::string readHeadOf(int fd);

class RepositoryStore {
public:
    explicit RepositoryStore(Database& db) : db_(db) {}

    // Sets and creates the content directory and deletes every file in it that no record names.
    std::string open(const std::string& dir);
    const std::string& dir() const { return dir_; }

    std::vector<RepositoryRecord> repositories();
    std::optional<RepositoryRecord> repository(const std::string& name);
    std::string addRepository(const RepositoryRecord& record);
    // Removes the repository with all its items; false when there was none.
    bool removeRepository(const std::string& name);

    std::vector<ItemRecord> items(const std::string& repository);  // by name
    std::vector<ItemRecord> allItems();                            // by repository, then name
    std::optional<ItemRecord> item(const std::string& repository, const std::string& name);
    std::optional<ItemRecord> itemById(std::int64_t id);
    // Records `content` (a temporary file in dir()) as the item's file. With `replace` the item
    // must exist, without it must not.
    std::string putItem(const std::string& repository, const std::string& name, TempFile& content, std::int64_t size,
                        bool replace);
    bool removeItem(const std::string& repository, const std::string& name);

    std::vector<ResourceRecord> resources(std::int64_t itemId);
    std::optional<ResourceRecord> resource(std::int64_t itemId, const std::string& name);
    std::string putResource(std::int64_t itemId, const std::string& name, TempFile& content, std::int64_t size,
                            bool replace);
    bool removeResource(std::int64_t itemId, const std::string& name);

    std::vector<ServiceRecord> services();
    std::optional<ServiceRecord> service(const std::string& name);
    std::optional<ServiceRecord> serviceById(std::int64_t id);
    std::string addService(const ServiceRecord& record);
    std::string updateService(const ServiceRecord& record);  // found by name
    bool removeService(const std::string& name);

    bool registered(std::int64_t serviceId, std::int64_t itemId);
    std::string registerItem(std::int64_t serviceId, std::int64_t itemId);
    bool deregisterItem(std::int64_t serviceId, std::int64_t itemId);
    std::vector<ItemRecord> registeredItems(std::int64_t serviceId);
    std::vector<std::int64_t> servicesOfItem(std::int64_t itemId);

    std::vector<PropertyRecord> properties(const std::string& ownerKey);
    std::string replaceProperties(const PropertyOwner& owner, const std::vector<PropertyRecord>& properties);

    // Opens a content file for reading. The lookup and the open happen under the database lock,
    // which replacing writers also hold while they delete old content, so the file cannot vanish
    // in between. Invalid when the record or the file is missing.
    UniqueFd openItem(const std::string& repository, const std::string& name, ItemRecord* found = nullptr);
    UniqueFd openResource(std::int64_t itemId, const std::string& name);
    // The first kMaxHeaderBytes of a content file.
    std::string readHead(const std::string& blob);

private:
    std::string blobPath(const std::string& blob) const { return dir_ + "/" + blob; }
    // Renames the temporary file to a fresh blob name; empty on failure with `error` set.
    std::string placeBlob(TempFile& content, std::string& error);
    void deleteBlobs(const std::vector<std::string>& blobs);
    std::vector<std::string> blobsOfItems(std::string_view where, const std::string& key);

    Database& db_;
    std::string dir_;
};

}  // namespace zelserverd
