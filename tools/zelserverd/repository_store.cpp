#include "repository_store.h"

#include <fcntl.h>
#include <unistd.h>

#include <filesystem>
#include <set>

#include "item_header.h"
#include "util.h"

namespace zelserverd {

namespace fs = std::filesystem;

namespace {

constexpr std::string_view kForbidden = "\\/:*?\"<>|&='+%";
constexpr std::string_view kItemColumns = "id, repository, name, blob, filesize, saved_at";
constexpr std::string_view kServiceColumns =
    "id, name, display_name, description, url_pattern, enabled, reg_workspace, "
    "reg_customformat, reg_customtransformer, reg_template";

RepositoryRecord repositoryFrom(const Statement& row) { return {row.text(0), row.text(1)}; }

ResourceRecord resourceFrom(const Statement& row) { return {row.text(0), row.text(1), row.integer(2)}; }

ItemRecord itemFrom(const Statement& row)
{
    return {row.integer(0), row.text(1), row.text(2), row.text(3), row.integer(4), row.text(5)};
}

ServiceRecord serviceFrom(const Statement& row)
{
    ServiceRecord s;
    s.id = row.integer(0);
    s.name = row.text(1);
    s.displayName = row.text(2);
    s.description = row.text(3);
    s.urlPattern = row.text(4);
    s.enabled = row.integer(5) != 0;
    s.workspaceRegistration = row.integer(6) != 0;
    s.customFormatRegistration = row.integer(7) != 0;
    s.customTransformerRegistration = row.integer(8) != 0;
    s.templateRegistration = row.integer(9) != 0;
    return s;
}

void bindService(Statement& st, const ServiceRecord& s)
{
    st.bind(1, s.name).bind(2, s.displayName).bind(3, s.description).bind(4, s.urlPattern);
    st.bind(5, std::int64_t{s.enabled}).bind(6, std::int64_t{s.workspaceRegistration});
    st.bind(7, std::int64_t{s.customFormatRegistration});
    st.bind(8, std::int64_t{s.customTransformerRegistration});
    st.bind(9, std::int64_t{s.templateRegistration});
}

}  // namespace

std::string checkName(std::string_view kind, std::string_view name)
{
    if (name.empty())
        return std::string(kind) + " name is empty";
    if (name.size() > 255)
        return std::string(kind) + " name is longer than 255 bytes";
    for (char c : name) {
        if (static_cast<unsigned char>(c) < 0x20 || c == 0x7f)
            return std::string(kind) + " name '" + std::string(name) + "' holds a control character";
        if (kForbidden.find(c) != std::string_view::npos)
            return std::string(kind) + " name '" + std::string(name) + "' holds the character '" + std::string(1, c) +
                   "', one of " + std::string(kForbidden);
    }
    return {};
}

std::string RepositoryStore::open(const std::string& dir)
{
    dir_ = dir;
    std::error_code ec;
    fs::create_directories(dir_, ec);
    if (ec || !fs::is_directory(dir_))
        return "cannot create content directory '" + dir_ + "'";
    std::set<std::string> referenced;
    {
        std::lock_guard lock(db_.mutex());
        Statement all(db_, "SELECT blob FROM items UNION ALL SELECT blob FROM resources");
        while (all.step())
            referenced.insert(all.text(0));
    }
    // Leftovers of an interrupted upload or of a crash between rename and commit.
    for (const auto& entry : fs::directory_iterator(dir_, ec)) {
        if (!referenced.count(entry.path().filename().string()))
            fs::remove(entry.path(), ec);
    }
    return {};
}

std::string RepositoryStore::placeBlob(TempFile& content, std::string& error)
{
    std::string blob = randomHex(16);
    if (blob.empty()) {
        error = "no random source for a content file name";
        return {};
    }
    error = content.commit(blobPath(blob));
    return error.empty() ? blob : std::string();
}

void RepositoryStore::deleteBlobs(const std::vector<std::string>& blobs)
{
    for (const auto& blob : blobs)
        ::unlink(blobPath(blob).c_str());
}

std::vector<std::string> RepositoryStore::blobsOfItems(std::string_view where, const std::string& key)
{
    std::vector<std::string> blobs;
    std::string w(where);
    Statement items(db_, "SELECT blob FROM items WHERE " + w + " = ?");
    items.bind(1, key);
    while (items.step())
        blobs.push_back(items.text(0));
    Statement resources(db_, "SELECT r.blob FROM resources r JOIN items i ON r.item_id = i.id "
                             "WHERE i." +
                                 w + " = ?");
    resources.bind(1, key);
    while (resources.step())
        blobs.push_back(resources.text(0));
    return blobs;
}

std::vector<RepositoryRecord> RepositoryStore::repositories()
{
    std::lock_guard lock(db_.mutex());
    Statement all(db_, "SELECT name, description FROM repositories ORDER BY name");
    return all.rows(repositoryFrom);
}

std::optional<RepositoryRecord> RepositoryStore::repository(const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT name, description FROM repositories WHERE name = ?");
    one.bind(1, name);
    return one.firstRow(repositoryFrom);
}

std::string RepositoryStore::addRepository(const RepositoryRecord& record)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement exists(db_, "SELECT 1 FROM repositories WHERE name = ?");
    exists.bind(1, record.name);
    if (exists.step())
        return "repository '" + record.name + "' already exists";
    Statement insert(db_, "INSERT INTO repositories (name, description) VALUES (?, ?)");
    insert.bind(1, record.name).bind(2, record.description);
    if (!insert.run())
        return "cannot store repository: " + insert.error();
    return tx.commit() ? std::string() : "cannot commit repository";
}

bool RepositoryStore::removeRepository(const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    std::vector<std::string> blobs = blobsOfItems("repository", name);
    Statement del(db_, "DELETE FROM repositories WHERE name = ?");
    del.bind(1, name);
    if (!del.run() || db_.changes() == 0 || !tx.commit())
        return false;
    deleteBlobs(blobs);
    return true;
}

std::vector<ItemRecord> RepositoryStore::items(const std::string& repository)
{
    std::lock_guard lock(db_.mutex());
    Statement all(db_, "SELECT " + std::string(kItemColumns) + " FROM items WHERE repository = ? ORDER BY name");
    all.bind(1, repository);
    return all.rows(itemFrom);
}

std::vector<ItemRecord> RepositoryStore::allItems()
{
    std::lock_guard lock(db_.mutex());
    Statement all(db_, "SELECT " + std::string(kItemColumns) + " FROM items ORDER BY repository, name");
    return all.rows(itemFrom);
}

std::optional<ItemRecord> RepositoryStore::item(const std::string& repository, const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT " + std::string(kItemColumns) + " FROM items WHERE repository = ? AND name = ?");
    one.bind(1, repository).bind(2, name);
    return one.firstRow(itemFrom);
}

std::optional<ItemRecord> RepositoryStore::itemById(std::int64_t id)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT " + std::string(kItemColumns) + " FROM items WHERE id = ?");
    one.bind(1, id);
    return one.firstRow(itemFrom);
}

std::string RepositoryStore::putItem(const std::string& repository, const std::string& name, TempFile& content,
                                     std::int64_t size, bool replace)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement repo(db_, "SELECT 1 FROM repositories WHERE name = ?");
    repo.bind(1, repository);
    if (!repo.step())
        return "unknown repository '" + repository + "'";
    Statement existing(db_, "SELECT blob FROM items WHERE repository = ? AND name = ?");
    existing.bind(1, repository).bind(2, name);
    bool exists = existing.step();
    std::string oldBlob = exists ? existing.text(0) : std::string();
    if (exists && !replace)
        return "item '" + name + "' already exists in '" + repository + "'";
    if (!exists && replace)
        return "item '" + name + "' does not exist in '" + repository + "'";
    std::string error;
    std::string blob = placeBlob(content, error);
    if (blob.empty())
        return error;
    Statement change(db_, replace ? "UPDATE items SET blob = ?3, filesize = ?4, saved_at = ?5 "
                                    "WHERE repository = ?1 AND name = ?2"
                                  : "INSERT INTO items (repository, name, blob, filesize, saved_at)"
                                    " VALUES (?1, ?2, ?3, ?4, ?5)");
    change.bind(1, repository).bind(2, name).bind(3, blob).bind(4, size);
    change.bind(5, isoTime(nowSeconds()));
    if (!change.run() || !tx.commit()) {
        deleteBlobs({blob});
        return "cannot store item '" + name + "': " + change.error();
    }
    if (!oldBlob.empty())
        deleteBlobs({oldBlob});
    return {};
}

bool RepositoryStore::removeItem(const std::string& repository, const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    std::vector<std::string> blobs;
    Statement find(db_, "SELECT id, blob FROM items WHERE repository = ? AND name = ?");
    find.bind(1, repository).bind(2, name);
    if (!find.step())
        return false;
    std::int64_t id = find.integer(0);
    blobs.push_back(find.text(1));
    Statement resources(db_, "SELECT blob FROM resources WHERE item_id = ?");
    resources.bind(1, id);
    while (resources.step())
        blobs.push_back(resources.text(0));
    Statement del(db_, "DELETE FROM items WHERE id = ?");
    del.bind(1, id);
    if (!del.run() || !tx.commit())
        return false;
    deleteBlobs(blobs);
    return true;
}

std::vector<ResourceRecord> RepositoryStore::resources(std::int64_t itemId)
{
    std::lock_guard lock(db_.mutex());
    Statement all(db_, "SELECT name, blob, filesize FROM resources WHERE item_id = ? ORDER BY name");
    all.bind(1, itemId);
    return all.rows(resourceFrom);
}

std::optional<ResourceRecord> RepositoryStore::resource(std::int64_t itemId, const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT name, blob, filesize FROM resources WHERE item_id = ? AND name = ?");
    one.bind(1, itemId).bind(2, name);
    return one.firstRow(resourceFrom);
}

std::string RepositoryStore::putResource(std::int64_t itemId, const std::string& name, TempFile& content,
                                         std::int64_t size, bool replace)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement item(db_, "SELECT 1 FROM items WHERE id = ?");
    item.bind(1, itemId);
    if (!item.step())
        return "the item no longer exists";
    Statement existing(db_, "SELECT blob FROM resources WHERE item_id = ? AND name = ?");
    existing.bind(1, itemId).bind(2, name);
    bool exists = existing.step();
    std::string oldBlob = exists ? existing.text(0) : std::string();
    if (exists && !replace)
        return "resource '" + name + "' already exists";
    if (!exists && replace)
        return "resource '" + name + "' does not exist";
    std::string error;
    std::string blob = placeBlob(content, error);
    if (blob.empty())
        return error;
    Statement change(db_, replace ? "UPDATE resources SET blob = ?3, filesize = ?4 "
                                    "WHERE item_id = ?1 AND name = ?2"
                                  : "INSERT INTO resources (item_id, name, blob, filesize) "
                                    "VALUES (?1, ?2, ?3, ?4)");
    change.bind(1, itemId).bind(2, name).bind(3, blob).bind(4, size);
    if (!change.run() || !tx.commit()) {
        deleteBlobs({blob});
        return "cannot store resource '" + name + "': " + change.error();
    }
    if (!oldBlob.empty())
        deleteBlobs({oldBlob});
    return {};
}

bool RepositoryStore::removeResource(std::int64_t itemId, const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement find(db_, "SELECT blob FROM resources WHERE item_id = ? AND name = ?");
    find.bind(1, itemId).bind(2, name);
    if (!find.step())
        return false;
    std::string blob = find.text(0);
    Statement del(db_, "DELETE FROM resources WHERE item_id = ? AND name = ?");
    del.bind(1, itemId).bind(2, name);
    if (!del.run() || !tx.commit())
        return false;
    deleteBlobs({blob});
    return true;
}

std::vector<ServiceRecord> RepositoryStore::services()
{
    std::lock_guard lock(db_.mutex());
    Statement all(db_, "SELECT " + std::string(kServiceColumns) + " FROM services ORDER BY name");
    return all.rows(serviceFrom);
}

std::optional<ServiceRecord> RepositoryStore::service(const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT " + std::string(kServiceColumns) + " FROM services WHERE name = ?");
    one.bind(1, name);
    return one.firstRow(serviceFrom);
}

std::optional<ServiceRecord> RepositoryStore::serviceById(std::int64_t id)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT " + std::string(kServiceColumns) + " FROM services WHERE id = ?");
    one.bind(1, id);
    return one.firstRow(serviceFrom);
}

std::string RepositoryStore::addService(const ServiceRecord& record)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement exists(db_, "SELECT 1 FROM services WHERE name = ?");
    exists.bind(1, record.name);
    if (exists.step())
        return "service '" + record.name + "' already exists";
    Statement insert(db_, "INSERT INTO services (name, display_name, description, url_pattern, "
                          "enabled, reg_workspace, reg_customformat, reg_customtransformer, "
                          "reg_template) VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?)");
    bindService(insert, record);
    if (!insert.run())
        return "cannot store service: " + insert.error();
    return tx.commit() ? std::string() : "cannot commit service";
}

std::string RepositoryStore::updateService(const ServiceRecord& record)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement update(db_, "UPDATE services SET display_name = ?2, description = ?3, "
                          "url_pattern = ?4, enabled = ?5, reg_workspace = ?6, "
                          "reg_customformat = ?7, reg_customtransformer = ?8, reg_template = ?9 "
                          "WHERE name = ?1");
    bindService(update, record);
    if (!update.run())
        return "cannot update service: " + update.error();
    if (db_.changes() == 0)
        return "unknown service '" + record.name + "'";
    return tx.commit() ? std::string() : "cannot commit service";
}

bool RepositoryStore::removeService(const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Statement del(db_, "DELETE FROM services WHERE name = ?");
    del.bind(1, name);
    return del.run() && db_.changes() > 0;
}

bool RepositoryStore::registered(std::int64_t serviceId, std::int64_t itemId)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT 1 FROM registrations WHERE service_id = ? AND item_id = ?");
    one.bind(1, serviceId).bind(2, itemId);
    return one.step();
}

std::string RepositoryStore::registerItem(std::int64_t serviceId, std::int64_t itemId)
{
    std::lock_guard lock(db_.mutex());
    Statement insert(db_, "INSERT INTO registrations (service_id, item_id) VALUES (?, ?)");
    insert.bind(1, serviceId).bind(2, itemId);
    if (insert.run())
        return {};
    // The primary key refuses a second registration; a vanished service or item fails the
    // foreign keys. Either way nothing was written.
    return "cannot register: " + insert.error();
}

bool RepositoryStore::deregisterItem(std::int64_t serviceId, std::int64_t itemId)
{
    std::lock_guard lock(db_.mutex());
    Statement del(db_, "DELETE FROM registrations WHERE service_id = ? AND item_id = ?");
    del.bind(1, serviceId).bind(2, itemId);
    return del.run() && db_.changes() > 0;
}

std::vector<ItemRecord> RepositoryStore::registeredItems(std::int64_t serviceId)
{
    std::lock_guard lock(db_.mutex());
    Statement all(db_, "SELECT i.id, i.repository, i.name, i.blob, i.filesize, i.saved_at "
                       "FROM items i JOIN registrations r ON r.item_id = i.id "
                       "WHERE r.service_id = ? ORDER BY i.repository, i.name");
    all.bind(1, serviceId);
    return all.rows(itemFrom);
}

std::vector<std::int64_t> RepositoryStore::servicesOfItem(std::int64_t itemId)
{
    std::lock_guard lock(db_.mutex());
    Statement all(db_, "SELECT r.service_id FROM registrations r JOIN services s "
                       "ON s.id = r.service_id WHERE r.item_id = ? ORDER BY s.name");
    all.bind(1, itemId);
    return all.rows([](const Statement& row) { return row.integer(0); });
}

std::vector<PropertyRecord> RepositoryStore::properties(const std::string& ownerKey)
{
    std::lock_guard lock(db_.mutex());
    std::vector<PropertyRecord> out;
    Statement all(db_, "SELECT id, category, name, value FROM properties WHERE owner = ? "
                       "ORDER BY category, name");
    all.bind(1, ownerKey);
    while (all.step()) {
        PropertyRecord p{all.text(1), all.text(2), all.text(3), {}};
        Statement attrs(db_, "SELECT name, value FROM property_attributes WHERE property_id = ? "
                             "ORDER BY name");
        attrs.bind(1, all.integer(0));
        while (attrs.step())
            p.attributes.emplace_back(attrs.text(0), attrs.text(1));
        out.push_back(std::move(p));
    }
    return out;
}

std::string RepositoryStore::replaceProperties(const PropertyOwner& owner,
                                               const std::vector<PropertyRecord>& properties)
{
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement del(db_, "DELETE FROM properties WHERE owner = ?");
    del.bind(1, owner.key);
    if (!del.run())
        return "cannot replace properties: " + del.error();
    for (const auto& p : properties) {
        // A later property of the same category and name replaces an earlier one, as clients
        // read them.
        Statement insert(db_, "INSERT OR REPLACE INTO properties "
                              "(owner, item_id, service_id, category, name, value) "
                              "VALUES (?, ?, ?, ?, ?, ?)");
        insert.bind(1, owner.key).bind(4, p.category).bind(5, p.name).bind(6, p.value);
        if (owner.itemId)
            insert.bind(2, owner.itemId);
        if (owner.serviceId)
            insert.bind(3, owner.serviceId);
        if (!insert.run())
            return "cannot store property: " + insert.error();
        std::int64_t id = db_.lastInsertId();
        for (const auto& [name, value] : p.attributes) {
            Statement attr(db_, "INSERT OR REPLACE INTO property_attributes "
                                "(property_id, name, value) VALUES (?, ?, ?)");
            attr.bind(1, id).bind(2, name).bind(3, value);
            if (!attr.run())
                return "cannot store property attribute: " + attr.error();
        }
    }
    return tx.commit() ? std::string() : "cannot commit properties";
}

UniqueFd RepositoryStore::openItem(const std::string& repository, const std::string& name, ItemRecord* found)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT " + std::string(kItemColumns) + " FROM items WHERE repository = ? AND name = ?");
    one.bind(1, repository).bind(2, name);
    if (!one.step())
        return {};
    ItemRecord record = itemFrom(one);
    if (found)
        *found = record;
    return UniqueFd(::open(blobPath(record.blob).c_str(), O_RDONLY | O_CLOEXEC));
}

UniqueFd RepositoryStore::openResource(std::int64_t itemId, const std::string& name)
{
    std::lock_guard lock(db_.mutex());
    Statement one(db_, "SELECT blob FROM resources WHERE item_id = ? AND name = ?");
    one.bind(1, itemId).bind(2, name);
    if (!one.step())
        return {};
    return UniqueFd(::open(blobPath(one.text(0)).c_str(), O_RDONLY | O_CLOEXEC));
}

std::string readHeadOf(int fd)
{
    std::string head(kMaxHeaderBytes, '\0');
    std::size_t got = 0;
    while (fd >= 0 && got < head.size()) {
        ssize_t n = ::pread(fd, head.data() + got, head.size() - got, static_cast<off_t>(got));
        if (n <= 0)
            break;
        got += static_cast<std::size_t>(n);
    }
    head.resize(got);
    return head;
}

std::string RepositoryStore::readHead(const std::string& blob)
{
    UniqueFd fd(::open(blobPath(blob).c_str(), O_RDONLY | O_CLOEXEC));
    return readHeadOf(fd.get());
}

}  // namespace zelserverd
