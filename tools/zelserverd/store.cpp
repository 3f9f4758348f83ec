#include "store.h"

#include <sqlite3.h>

#include "util.h"

namespace zelserverd {

namespace {

// Each entry upgrades the schema by one version; entries are never edited once released.
constexpr std::string_view kMigrations[] = {
    R"sql(
CREATE TABLE user_tokens (
  account TEXT PRIMARY KEY,
  token TEXT NOT NULL UNIQUE,
  client_address TEXT NOT NULL,
  timeout_seconds INTEGER NOT NULL,
  first_date TEXT NOT NULL,
  last_date TEXT NOT NULL,
  expiration_date TEXT NOT NULL,
  expires_at INTEGER NOT NULL
);
)sql",
    // Repositories, their items and resources, services, registrations, properties, jobs.
    // Item and resource contents are files in the store directory named by "blob".
    R"sql(
CREATE TABLE repositories (
  name TEXT PRIMARY KEY,
  description TEXT NOT NULL
);
CREATE TABLE items (
  id INTEGER PRIMARY KEY AUTOINCREMENT,
  repository TEXT NOT NULL REFERENCES repositories(name) ON DELETE CASCADE,
  name TEXT NOT NULL,
  blob TEXT NOT NULL,
  filesize INTEGER NOT NULL,
  saved_at TEXT NOT NULL,
  UNIQUE (repository, name)
);
CREATE TABLE resources (
  item_id INTEGER NOT NULL REFERENCES items(id) ON DELETE CASCADE,
  name TEXT NOT NULL,
  blob TEXT NOT NULL,
  filesize INTEGER NOT NULL,
  PRIMARY KEY (item_id, name)
);
CREATE TABLE services (
  id INTEGER PRIMARY KEY AUTOINCREMENT,
  name TEXT NOT NULL UNIQUE,
  display_name TEXT NOT NULL,
  description TEXT NOT NULL,
  url_pattern TEXT NOT NULL,
  enabled INTEGER NOT NULL,
  reg_workspace INTEGER NOT NULL,
  reg_customformat INTEGER NOT NULL,
  reg_customtransformer INTEGER NOT NULL,
  reg_template INTEGER NOT NULL
);
CREATE TABLE registrations (
  service_id INTEGER NOT NULL REFERENCES services(id) ON DELETE CASCADE,
  item_id INTEGER NOT NULL REFERENCES items(id) ON DELETE CASCADE,
  PRIMARY KEY (service_id, item_id)
);
CREATE TABLE properties (
  id INTEGER PRIMARY KEY AUTOINCREMENT,
  owner TEXT NOT NULL,
  item_id INTEGER REFERENCES items(id) ON DELETE CASCADE,
  service_id INTEGER REFERENCES services(id) ON DELETE CASCADE,
  category TEXT NOT NULL,
  name TEXT NOT NULL,
  value TEXT NOT NULL,
  UNIQUE (owner, category, name)
);
CREATE TABLE property_attributes (
  property_id INTEGER NOT NULL REFERENCES properties(id) ON DELETE CASCADE,
  name TEXT NOT NULL,
  value TEXT NOT NULL,
  PRIMARY KEY (property_id, name)
);
CREATE TABLE jobs (
  id INTEGER PRIMARY KEY AUTOINCREMENT,
  keyword TEXT NOT NULL,
  request TEXT NOT NULL,
  user TEXT NOT NULL,
  status TEXT NOT NULL,
  time_requested TEXT NOT NULL,
  time_started TEXT NOT NULL,
  time_finished TEXT NOT NULL,
  result_number INTEGER NOT NULL,
  result_message TEXT NOT NULL,
  requester_host TEXT NOT NULL,
  requester_port TEXT NOT NULL
);
)sql",
};

}  // namespace

Database::~Database()
{
    if (db_)
        sqlite3_close(db_);
}

std::string Database::open(const std::string& path)
{
    int rc = sqlite3_open_v2(path.c_str(), &db_, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_FULLMUTEX,
                             nullptr);
    if (rc != SQLITE_OK) {
        std::string error = "cannot open database '" + path + "': " + (db_ ? sqlite3_errmsg(db_) : sqlite3_errstr(rc));
        sqlite3_close(db_);
        db_ = nullptr;
        return error;
    }
    sqlite3_busy_timeout(db_, 5000);
    std::string error = exec("PRAGMA journal_mode=WAL; PRAGMA synchronous=FULL; "
                             "PRAGMA foreign_keys=ON;");
    if (!error.empty())
        return error;
    Statement version(*this, "PRAGMA user_version");
    if (!version.step())
        return "cannot read schema version: " + version.error();
    std::int64_t current = version.integer(0);
    constexpr auto kLatest = static_cast<std::int64_t>(std::size(kMigrations));
    if (current > kLatest)
        return "database was written by a newer zelserverd";
    for (std::int64_t v = current; v < kLatest; ++v) {
        std::lock_guard lock(mutex_);
        Transaction tx(*this);
        error = exec(kMigrations[v]);
        if (error.empty())
            error = exec("PRAGMA user_version=" + std::to_string(v + 1));
        if (!error.empty() || !tx.commit())
            return "schema upgrade to version " + std::to_string(v + 1) + " failed: " + error;
    }
    return {};
}

std::string Database::exec(std::string_view sql)
{
    char* message = nullptr;
    std::string text(sql);
    if (sqlite3_exec(db_, text.c_str(), nullptr, nullptr, &message) == SQLITE_OK)
        return {};
    std::string error = message ? message : "unknown database error";
    sqlite3_free(message);
    return error;
}

std::int64_t Database::changes() const { return sqlite3_changes64(db_); }

std::int64_t Database::lastInsertId() const { return sqlite3_last_insert_rowid(db_); }

Statement::Statement(Database& db, std::string_view sql) : db_(db)
{
    if (sqlite3_prepare_v2(db.handle(), sql.data(), static_cast<int>(sql.size()), &stmt_, nullptr) != SQLITE_OK)
        stmt_ = nullptr;
}

Statement::~Statement()
{
    if (stmt_)
        sqlite3_finalize(stmt_);
}

Statement& Statement::bind(int index, std::string_view text)
{
    if (stmt_)
        sqlite3_bind_text(stmt_, index, text.data(), static_cast<int>(text.size()), SQLITE_TRANSIENT);
    return *this;
}

Statement& Statement::bind(int index, std::int64_t value)
{
    if (stmt_)
        sqlite3_bind_int64(stmt_, index, value);
    return *this;
}

bool Statement::step()
{
    if (!stmt_)
        return false;
    lastRc_ = sqlite3_step(stmt_);
    return lastRc_ == SQLITE_ROW;
}

bool Statement::run()
{
    if (!stmt_)
        return false;
    lastRc_ = sqlite3_step(stmt_);
    return lastRc_ == SQLITE_DONE;
}

std::string Statement::text(int column) const
{
    const unsigned char* value = sqlite3_column_text(stmt_, column);
    if (!value)
        return {};
    return std::string(reinterpret_cast<const char*>(value),
                       static_cast<std::size_t>(sqlite3_column_bytes(stmt_, column)));
}

std::int64_t Statement::integer(int column) const { return sqlite3_column_int64(stmt_, column); }

std::string Statement::error() const { return sqlite3_errmsg(db_.handle()); }

Transaction::Transaction(Database& db) : db_(db) { open_ = db_.exec("BEGIN IMMEDIATE").empty(); }

Transaction::~Transaction()
{
    if (open_)
        db_.exec("ROLLBACK");
}

bool Transaction::commit()
{
    if (!open_)
        return false;
    open_ = false;
    return db_.exec("COMMIT").empty();
}

bool clientAddressMatches(std::string_view stored, std::string_view peer)
{
    if (stored == peer)
        return true;
    if (stored == "localhost")
        return peer == "127.0.0.1" || peer == "::1" || peer == "::ffff:127.0.0.1";
    return false;
}

namespace {
constexpr std::string_view kTokenColumns = "account, token, client_address, timeout_seconds, first_date, last_date, "
                                           "expiration_date, expires_at";
}

std::optional<UserToken> TokenStore::selectOne(std::string_view where, const std::string& key)
{
    std::lock_guard lock(db_.mutex());
    Statement select(db_,
                     "SELECT " + std::string(kTokenColumns) + " FROM user_tokens WHERE " + std::string(where) + " = ?");
    select.bind(1, key);
    if (!select.step())
        return std::nullopt;
    UserToken token;
    token.account = select.text(0);
    token.token = select.text(1);
    token.clientAddress = select.text(2);
    token.timeoutSeconds = select.integer(3);
    token.firstDate = select.text(4);
    token.lastDate = select.text(5);
    token.expirationDate = select.text(6);
    token.expiresAt = select.integer(7);
    return token;
}

std::optional<UserToken> TokenStore::get(const std::string& account) { return selectOne("account", account); }

std::optional<UserToken> TokenStore::findByToken(const std::string& token) { return selectOne("token", token); }

std::string TokenStore::write(UserToken& token, bool insert)
{
    std::int64_t now = nowSeconds();
    if (token.token.empty())
        token.token = randomHex(24);
    if (token.token.empty())
        return "no random source for a new token";
    token.lastDate = isoTime(now);
    token.expiresAt = token.timeoutSeconds > 0 ? now + token.timeoutSeconds : 0;
    token.expirationDate = token.expiresAt ? isoTime(token.expiresAt) : std::string();
    std::lock_guard lock(db_.mutex());
    Transaction tx(db_);
    Statement owner(db_, "SELECT account FROM user_tokens WHERE token = ?");
    owner.bind(1, token.token);
    if (owner.step() && owner.text(0) != token.account)
        return "this token text is already in use";
    Statement existing(db_, "SELECT first_date FROM user_tokens WHERE account = ?");
    existing.bind(1, token.account);
    bool exists = existing.step();
    if (insert && exists)
        return "account '" + token.account + "' already has a user token";
    if (!insert && !exists)
        return "account '" + token.account + "' has no user token";
    token.firstDate = insert ? token.lastDate : existing.text(0);
    Statement change(db_, "INSERT OR REPLACE INTO user_tokens (" + std::string(kTokenColumns) +
                              ") VALUES (?, ?, ?, ?, ?, ?, ?, ?)");
    change.bind(1, token.account).bind(2, token.token).bind(3, token.clientAddress);
    change.bind(4, token.timeoutSeconds).bind(5, token.firstDate).bind(6, token.lastDate);
    change.bind(7, token.expirationDate).bind(8, token.expiresAt);
    if (!change.run())
        return "cannot store user token: " + change.error();
    if (!tx.commit())
        return "cannot commit user token";
    return {};
}

std::string TokenStore::add(UserToken token) { return write(token, true); }

std::string TokenStore::update(UserToken token) { return write(token, false); }

bool TokenStore::remove(const std::string& account)
{
    std::lock_guard lock(db_.mutex());
    Statement del(db_, "DELETE FROM user_tokens WHERE account = ?");
    del.bind(1, account);
    return del.run() && sqlite3_changes(db_.handle()) > 0;
}

void TokenStore::touch(const std::string& account)
{
    std::lock_guard lock(db_.mutex());
    Statement update(db_, "UPDATE user_tokens SET last_date = ? WHERE account = ?");
    update.bind(1, isoTime(nowSeconds())).bind(2, account);
    update.run();
}

}  // namespace zelserverd
