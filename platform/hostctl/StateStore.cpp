#include "StateStore.h"

#include <sys/stat.h>

#include <cerrno>

#include "hostctl/MeskCtlException.h"

using HostCtl::Lib::Mesk::MeskCtlException;

namespace HostCtlSim {

namespace {

const int kSchemaVersion = 1;
const int kBusyTimeoutMs = 30000;

const char* const kSchema = R"sql(
CREATE TABLE IF NOT EXISTS section(name TEXT PRIMARY KEY, value TEXT NOT NULL) WITHOUT ROWID;
CREATE TABLE IF NOT EXISTS disk(
    uuid TEXT PRIMARY KEY,
    position INTEGER NOT NULL,
    name TEXT NOT NULL,
    lun INTEGER NOT NULL,
    grp TEXT NOT NULL,
    record TEXT NOT NULL);
CREATE INDEX IF NOT EXISTS disk_position ON disk(position);
CREATE INDEX IF NOT EXISTS disk_name ON disk(name);
CREATE INDEX IF NOT EXISTS disk_grp ON disk(grp);
CREATE TABLE IF NOT EXISTS fault(
    op TEXT NOT NULL, call INTEGER NOT NULL, message TEXT NOT NULL, PRIMARY KEY(op, call));
CREATE TABLE IF NOT EXISTS call_log(
    seq INTEGER PRIMARY KEY, invocation TEXT NOT NULL, time INTEGER NOT NULL,
    entry TEXT NOT NULL);
)sql";

// The top-level keys stored as sections, in document order.
const char* const kSections[] = {"host",    "cluster",  "membership", "unicastAgents", "network",
                                 "storage", "settings", "policies",   "resync"};

void MakeDirectories(const std::string& path) {
    for (size_t slash = path.find('/', 1); slash != std::string::npos;
         slash = path.find('/', slash + 1)) {
        mkdir(path.substr(0, slash).c_str(), 0755);
    }
}

std::string ColumnText(sqlite3_stmt* statement, int column) {
    const unsigned char* text = sqlite3_column_text(statement, column);
    return text ? std::string(reinterpret_cast<const char*>(text),
                              static_cast<size_t>(sqlite3_column_bytes(statement, column)))
                : std::string();
}

void Bind(sqlite3_stmt* statement, int index, const std::string& text) {
    sqlite3_bind_text(statement, index, text.data(), static_cast<int>(text.size()),
                      SQLITE_TRANSIENT);
}

// Resets a prepared statement when the scope ends, whatever way it ends.
class Use {
  public:
    explicit Use(sqlite3_stmt* statement) : statement_(statement) {}
    ~Use() {
        sqlite3_reset(statement_);
        sqlite3_clear_bindings(statement_);
    }
    operator sqlite3_stmt*() const { return statement_; }

  private:
    sqlite3_stmt* statement_;
};

}  // namespace

StateStore::StateStore(std::string path) : path_(std::move(path)) {}

StateStore::~StateStore() {
    for (auto& entry : statements_) sqlite3_finalize(entry.second);
    if (db_ != nullptr) sqlite3_close(db_);
}

void StateStore::Fail(const std::string& what) {
    std::string detail = db_ != nullptr ? sqlite3_errmsg(db_) : "out of memory";
    throw MeskCtlException("Simulated host state " + path_ + ": " + what + ": " + detail);
}

void StateStore::Exec(const char* sql) {
    char* error = nullptr;
    if (sqlite3_exec(db_, sql, nullptr, nullptr, &error) != SQLITE_OK) {
        std::string message = error ? error : "unknown error";
        sqlite3_free(error);
        throw MeskCtlException("Simulated host state " + path_ + ": " + message);
    }
}

sqlite3_stmt* StateStore::Statement(const char* sql) {
    auto it = statements_.find(sql);
    if (it != statements_.end()) return it->second;
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v3(db_, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) !=
        SQLITE_OK) {
        Fail("cannot prepare a query");
    }
    statements_[sql] = statement;
    return statement;
}

bool StateStore::Open() {
    if (db_ != nullptr) return false;
    // Set once, before SQLite's first use in the process, for short-lived processes: no
    // memory statistics (a mutex around every allocation), no page cache laid out in advance
    // and a small lookaside, which every invocation would otherwise pay for in page faults.
    static const bool configured = [] {
        sqlite3_config(SQLITE_CONFIG_MEMSTATUS, 0);
        sqlite3_config(SQLITE_CONFIG_PAGECACHE, nullptr, 0, 0);
        sqlite3_config(SQLITE_CONFIG_LOOKASIDE, 128, 32);
        return true;
    }();
    (void)configured;
    MakeDirectories(path_);
    if (sqlite3_open_v2(path_.c_str(), &db_, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE, nullptr) !=
        SQLITE_OK) {
        std::string detail = db_ != nullptr ? sqlite3_errmsg(db_) : "out of memory";
        sqlite3_close(db_);
        db_ = nullptr;
        throw MeskCtlException("Simulated host state " + path_ + ": cannot open: " + detail);
    }
    try {
        return Prepare();
    } catch (...) {
        for (auto& entry : statements_) sqlite3_finalize(entry.second);
        statements_.clear();
        sqlite3_close(db_);
        db_ = nullptr;
        throw;
    }
}

bool StateStore::Prepare() {
    sqlite3_busy_timeout(db_, kBusyTimeoutMs);
    // In WAL mode, NORMAL syncs only when the log is folded back into the database, not on
    // every commit: a killed process leaves a consistent state, and even a crash of the
    // machine can lose at most the last changes, never corrupt the database. A sync on every
    // commit would cost each invocation milliseconds of waiting for the disk.
    Exec("PRAGMA synchronous=NORMAL");
    if (SchemaVersion() == kSchemaVersion) return false;
    if (SchemaVersion() > kSchemaVersion) {
        throw MeskCtlException("Simulated host state " + path_ + ": made by a newer hostsim");
    }

    // A new database: switch it to WAL (a setting kept in the file), then create the host.
    // Another process may be doing the same; the transaction decides which one does it.
    Exec("PRAGMA journal_mode=WAL");
    Transaction transaction(*this);
    if (SchemaVersion() == kSchemaVersion) return false;
    Exec(kSchema);
    Replace(NormalizeHost(DefaultHost()));
    Exec(("PRAGMA user_version=" + std::to_string(kSchemaVersion)).c_str());
    transaction.Commit();
    return true;
}

int StateStore::SchemaVersion() {
    Use query(Statement("PRAGMA user_version"));
    return sqlite3_step(query) == SQLITE_ROW ? sqlite3_column_int(query, 0) : 0;
}

StateStore::Transaction::Transaction(StateStore& store) : store_(store) {
    store_.Exec("BEGIN IMMEDIATE");
}

StateStore::Transaction::~Transaction() {
    if (!done_) sqlite3_exec(store_.db_, "ROLLBACK", nullptr, nullptr, nullptr);
}

void StateStore::Transaction::Commit() {
    store_.Exec("COMMIT");
    done_ = true;
}

Json StateStore::ReadSection(const std::string& name) {
    Use query(Statement("SELECT value FROM section WHERE name = ?1"));
    Bind(query, 1, name);
    if (sqlite3_step(query) != SQLITE_ROW) Fail("no section " + name);
    return Json::parse(ColumnText(query, 0));
}

void StateStore::WriteSection(const std::string& name, const Json& value) {
    Use statement(Statement("INSERT OR REPLACE INTO section(name, value) VALUES(?1, ?2)"));
    Bind(statement, 1, name);
    Bind(statement, 2, JsonText(value));
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write " + name);
}

std::vector<StateStore::Lun> StateStore::ReadLuns() {
    Use query(Statement("SELECT name, uuid FROM disk WHERE lun ORDER BY position"));
    std::vector<Lun> luns;
    while (sqlite3_step(query) == SQLITE_ROW) {
        luns.push_back(Lun{ColumnText(query, 0), ColumnText(query, 1)});
    }
    return luns;
}

std::vector<std::string> StateStore::ReadGroupedDiskUuids() {
    Use query(Statement("SELECT uuid FROM disk WHERE grp <> '' ORDER BY position"));
    std::vector<std::string> uuids;
    while (sqlite3_step(query) == SQLITE_ROW) uuids.push_back(ColumnText(query, 0));
    return uuids;
}

bool StateStore::ReadDisk(const std::string& uuid, Json& disk) {
    std::string record;
    if (!ReadDiskRecord(uuid, record)) return false;
    disk = Json::parse(record);
    return true;
}

bool StateStore::ReadDiskRecord(const std::string& uuid, std::string& record) {
    Use query(Statement("SELECT record FROM disk WHERE uuid = ?1"));
    Bind(query, 1, uuid);
    if (sqlite3_step(query) != SQLITE_ROW) return false;
    record = ColumnText(query, 0);
    return true;
}

bool StateStore::ReadDiskByName(const std::string& name, Json& disk) {
    Use query(Statement("SELECT record FROM disk WHERE name = ?1 AND lun"));
    Bind(query, 1, name);
    if (sqlite3_step(query) != SQLITE_ROW) return false;
    disk = Json::parse(ColumnText(query, 0));
    return true;
}

std::vector<Json> StateStore::ReadDiskGroup(const std::string& groupUuid) {
    Use query(Statement("SELECT record FROM disk WHERE grp = ?1 ORDER BY position"));
    Bind(query, 1, groupUuid);
    std::vector<Json> disks;
    while (sqlite3_step(query) == SQLITE_ROW) disks.push_back(Json::parse(ColumnText(query, 0)));
    return disks;
}

void StateStore::UpdateDisk(const Json& disk) {
    Use statement(
        Statement("UPDATE disk SET name = ?2, lun = ?3, grp = ?4, record = ?5 "
                  "WHERE uuid = ?1"));
    Bind(statement, 1, disk["uuid"].get<std::string>());
    Bind(statement, 2, disk["name"].get<std::string>());
    sqlite3_bind_int(statement, 3, disk["lun"].get<bool>() ? 1 : 0);
    Bind(statement, 4, disk["diskGroupUuid"].get<std::string>());
    Bind(statement, 5, JsonText(disk));
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write a disk");
}

void StateStore::InsertDisk(const Json& disk, int64_t position) {
    Use statement(
        Statement("INSERT INTO disk(uuid, position, name, lun, grp, record) "
                  "VALUES(?1, ?2, ?3, ?4, ?5, ?6)"));
    Bind(statement, 1, disk["uuid"].get<std::string>());
    sqlite3_bind_int64(statement, 2, position);
    Bind(statement, 3, disk["name"].get<std::string>());
    sqlite3_bind_int(statement, 4, disk["lun"].get<bool>() ? 1 : 0);
    Bind(statement, 5, disk["diskGroupUuid"].get<std::string>());
    Bind(statement, 6, JsonText(disk));
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write a disk");
}

void StateStore::DeleteDisk(const std::string& uuid) {
    Use statement(Statement("DELETE FROM disk WHERE uuid = ?1"));
    Bind(statement, 1, uuid);
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot delete a disk");
}

Json StateStore::Dump() {
    // One read transaction, so that the sections agree with each other.
    bool own = sqlite3_get_autocommit(db_) != 0;
    if (own) Exec("BEGIN");
    Json host;
    for (const char* name : kSections) host[name] = ReadSection(name);
    Json disks = Json::array();
    Use query(Statement("SELECT record FROM disk ORDER BY position"));
    while (sqlite3_step(query) == SQLITE_ROW) disks.push_back(Json::parse(ColumnText(query, 0)));
    host["storage"]["disks"] = std::move(disks);
    if (own) Exec("COMMIT");
    return host;
}

void StateStore::Replace(const Json& host) {
    Exec("DELETE FROM section; DELETE FROM disk;");
    for (const char* name : kSections) {
        Json value = host.at(name);
        if (value.is_object()) value.erase("disks");
        WriteSection(name, value);
    }
    int64_t position = 0;
    for (const Json& disk : host.at("storage").at("disks")) InsertDisk(disk, position++);
}

std::vector<Fault> StateStore::ReadFaults() {
    Use query(Statement("SELECT op, call, message FROM fault ORDER BY op, call"));
    std::vector<Fault> faults;
    while (sqlite3_step(query) == SQLITE_ROW) {
        faults.push_back(
            Fault{ColumnText(query, 0), sqlite3_column_int64(query, 1), ColumnText(query, 2)});
    }
    return faults;
}

void StateStore::SetFault(const Fault& fault) {
    Use statement(Statement("INSERT OR REPLACE INTO fault(op, call, message) VALUES(?1, ?2, ?3)"));
    Bind(statement, 1, fault.op);
    sqlite3_bind_int64(statement, 2, fault.call);
    Bind(statement, 3, fault.message);
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write a failure");
}

void StateStore::ClearFaults() {
    Exec("DELETE FROM fault");
}

void StateStore::AppendCalls(const std::string& invocation, const std::vector<CallRecord>& calls) {
    bool logged = false;
    {
        Use query(Statement("SELECT 1 FROM call_log WHERE invocation = ?1 LIMIT 1"));
        Bind(query, 1, invocation);
        logged = sqlite3_step(query) == SQLITE_ROW;
    }
    if (logged) {
        Use statement(Statement("DELETE FROM call_log WHERE invocation <> ?1"));
        Bind(statement, 1, invocation);
        if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot clear the call log");
    } else {
        // The invocation's first calls: every row is another's, and a DELETE without WHERE
        // drops the table's pages at once instead of tens of thousands of rows one by one.
        ClearCalls();
    }
    Use statement(Statement("INSERT INTO call_log(invocation, time, entry) VALUES(?1, ?2, ?3)"));
    for (const CallRecord& call : calls) {
        Bind(statement, 1, invocation);
        sqlite3_bind_int64(statement, 2, call.time);
        Bind(statement, 3, call.entry);
        if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write the call log");
        sqlite3_reset(statement);
    }
}

std::vector<CallRecord> StateStore::ReadCalls() {
    Use query(Statement("SELECT time, entry FROM call_log ORDER BY seq"));
    std::vector<CallRecord> calls;
    while (sqlite3_step(query) == SQLITE_ROW) {
        calls.push_back(CallRecord{sqlite3_column_int64(query, 0), ColumnText(query, 1)});
    }
    return calls;
}

void StateStore::ClearCalls() {
    Exec("DELETE FROM call_log");
}

}  // namespace HostCtlSim
