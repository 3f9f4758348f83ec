// Persistent state in one SQLite database in the data directory. Every change is one
// transaction committed before the command is answered, so an acknowledged change survives a
// crash or a restart.
#pragma once

#include <cstdint>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

struct sqlite3;
struct sqlite3_stmt;

namespace zelserverd {

class Statement;

class Database {
public:
    Database() = default;
    Database(const Database&) = delete;
    Database& operator=(const Database&) = delete;
    ~Database();

    // Opens (creating when needed) the database file and brings its schema up to date.
    std::string open(const std::string& path);
    // Runs one or more statements without results; returns the error text or empty.
    std::string exec(std::string_view sql);
    sqlite3* handle() const { return db_; }
    // Rows changed by the last statement, and the row id of the last insert, on this connection.
    std::int64_t changes() const;
    std::int64_t lastInsertId() const;
    // Serialises all work on the connection: a multi-statement change holds it throughout.
    std::mutex& mutex() { return mutex_; }

private:
    sqlite3* db_ = nullptr;
    std::mutex mutex_;
};

// One prepared statement, finalised when destroyed. Binding indices start at 1.
class Statement {
public:
    Statement(Database& db, std::string_view sql);
    Statement(const Statement&) = delete;
    Statement& operator=(const Statement&) = delete;
    ~Statement();

    bool ok() const { return stmt_ != nullptr; }
    Statement& bind(int index, std::string_view text);
    Statement& bind(int index, std::int64_t value);
    // True while a row is available; false at the end or on error (see done()).
    bool step();
    // Runs a statement that returns no rows; true on success.
    bool run();
    std::string text(int column) const;
    std::int64_t integer(int column) const;
    std::string error() const;

    // The next row as `from` reads it; nullopt when there is none (at the end or on error).
    template <class From>
    auto firstRow(From from) -> std::optional<decltype(from(*this))>
    {
        if (!step())
            return std::nullopt;
        return from(*this);
    }
    // Every remaining row as `from` reads it.
    template <class From>
    auto rows(From from) -> std::vector<decltype(from(*this))>
    {
        std::vector<decltype(from(*this))> read;
        while (step())
            read.push_back(from(*this));
        return read;
    }

private:
    Database& db_;
    sqlite3_stmt* stmt_ = nullptr;
    int lastRc_ = 0;
};

// Begins a transaction; rolls it back when destroyed without commit(). Hold the database mutex.
class Transaction {
public:
    explicit Transaction(Database& db);
    ~Transaction();
    bool commit();

private:
    Database& db_;
    bool open_ = false;
};

struct UserToken {
    std::string account;
    std::string token;
    std::string clientAddress;
    std::int64_t timeoutSeconds = 0;  // 0 or less: the token never expires
    std::string firstDate;
    std::string lastDate;
    std::string expirationDate;
    std::int64_t expiresAt = 0;  // epoch seconds, 0: never

    bool expired(std::int64_t now) const { return expiresAt != 0 && now >= expiresAt; }
};

// A stored client address of "localhost" also matches the loopback addresses.
bool clientAddressMatches(std::string_view stored, std::string_view peer);

class TokenStore {
public:
    explicit TokenStore(Database& db) : db_(db) {}

    std::optional<UserToken> get(const std::string& account);
    std::optional<UserToken> findByToken(const std::string& token);
    // Add fails when the account already has a token or the token text is taken by another.
    std::string add(UserToken token);
    std::string update(UserToken token);
    bool remove(const std::string& account);
    void touch(const std::string& account);

private:
    std::optional<UserToken> selectOne(std::string_view where, const std::string& key);
    std::string write(UserToken& token, bool insert);

    Database& db_;
};

}  // namespace zelserverd
