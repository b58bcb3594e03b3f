// Reading and writing the simulated host's state: its tables, the transactions and what each
// has read. StateOpen.cpp opens the database.
#include "StateStore.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <stdexcept>

#include "UuidText.h"
#include "hostctl/MeskCtlException.h"

using HostCtl::Lib::Mesk::MeskCtlException;

namespace HostCtlSim {

namespace {

// The section that holds the version of the document's keys, a number; none in version 1.
const char* const kVersionSection = "documentVersion";

// The top-level keys stored as sections, in document order.
const char* const kSections[] = {"host",    "cluster",  "membership", "unicastAgents", "network",
                                 "storage", "settings", "policies",   "resync"};

// The disk table's columns, one per field of a disk, in document order: "name, uuid, ...".
const std::string& DiskColumns() {
    static const std::string columns = [] {
        std::string list;
        Disk disk;
        ForEachDiskField(disk, [&](const char* key, auto&, DiskCheck) {
            list += (list.empty() ? "" : ", ") + std::string(key);
        });
        return list;
    }();
    return columns;
}

// "?2, ?3, ..." for the disk's columns, from ?`first` on.
std::string DiskParameters(int first) {
    std::string list;
    Disk disk;
    ForEachDiskField(disk, [&](const char*, auto&, DiskCheck) {
        list += (list.empty() ? "?" : ", ?") + std::to_string(first++);
    });
    return list;
}

bool IsReadOnlyError(int code) {
    return (code & 0xff) == SQLITE_READONLY || (code & 0xff) == SQLITE_CANTOPEN ||
           (code & 0xff) == SQLITE_PERM;
}

void Read(sqlite3_stmt* statement, int column, std::string& text) {
    const unsigned char* value = sqlite3_column_text(statement, column);
    text.assign(value ? reinterpret_cast<const char*>(value) : "",
                static_cast<size_t>(sqlite3_column_bytes(statement, column)));
}
void Read(sqlite3_stmt* statement, int column, bool& flag) {
    flag = sqlite3_column_int(statement, column) != 0;
}
void Read(sqlite3_stmt* statement, int column, int64_t& number) {
    number = sqlite3_column_int64(statement, column);
}
// Sizes above 2^63 are kept as the integer of the same bits.
void Read(sqlite3_stmt* statement, int column, uint64_t& number) {
    number = static_cast<uint64_t>(sqlite3_column_int64(statement, column));
}

void Bind(sqlite3_stmt* statement, int index, const std::string& text) {
    sqlite3_bind_text(statement, index, text.data(), static_cast<int>(text.size()),
                      SQLITE_TRANSIENT);
}
void Bind(sqlite3_stmt* statement, int index, bool flag) {
    sqlite3_bind_int(statement, index, flag ? 1 : 0);
}
void Bind(sqlite3_stmt* statement, int index, int64_t number) {
    sqlite3_bind_int64(statement, index, number);
}
void Bind(sqlite3_stmt* statement, int index, uint64_t number) {
    sqlite3_bind_int64(statement, index, static_cast<int64_t>(number));
}

// Binds the disk's fields to ?`first` and on.
void BindDisk(sqlite3_stmt* statement, int first, const Disk& disk) {
    ForEachDiskField(disk, [&](const char*, const auto& member, DiskCheck) {
        Bind(statement, first++, member);
    });
}

// The order in which failures are consulted: by operation, then every call (0) before the Nth.
bool FaultOrder(const Fault& a, const Fault& b) {
    return a.op != b.op ? a.op < b.op : a.call < b.call;
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
    Disconnect();
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

int64_t StateStore::QueryNumber(const char* sql) {
    Use query(Statement(sql));
    if (sqlite3_step(query) != SQLITE_ROW) Fail("cannot read");
    return sqlite3_column_int64(query, 0);
}

sqlite3_stmt* StateStore::Statement(const char* sql) {
    for (const auto& entry : statements_) {
        if (entry.first == sql) return entry.second;
    }
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v3(db_, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) !=
        SQLITE_OK) {
        Fail("cannot prepare a query");
    }
    statements_.emplace_back(sql, statement);
    return statement;
}

void StateStore::Forget() {
    sectionsLoaded_ = false;
    sections_.clear();
    faults_.clear();
    disksLoaded_ = false;
    disks_.clear();
    diskUuids_.clear();
    byUuid_.Clear();
    byDevice_.Clear();
}

void StateStore::BeginRead() {
    if (transaction_ != TransactionKind::kNone) return;
    Exec("BEGIN");
    transaction_ = TransactionKind::kReading;
}

void StateStore::BeginWrite() {
    if (db_ == nullptr) Open();
    if (transaction_ == TransactionKind::kWriting) {
        throw std::logic_error("a change of the simulated host begun within another");
    }
    // The read transaction ends, and with it everything it read: the change reads the state
    // as it is when it holds the write lock.
    if (transaction_ == TransactionKind::kReading) EndTransaction("COMMIT");
    if (!writable_) {
        Disconnect();
        Connect(path_, true);
    }
    int code = sqlite3_exec(db_, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr);
    if (IsReadOnlyError(code)) RefuseChange();
    if (code != SQLITE_OK) Fail("cannot begin a change");
    transaction_ = TransactionKind::kWriting;
}

void StateStore::EndTransaction(const char* sql) {
    transaction_ = TransactionKind::kNone;
    Forget();
    if (sqlite3_exec(db_, sql, nullptr, nullptr, nullptr) != SQLITE_OK) Fail(sql);
}

StateStore::Transaction::Transaction(StateStore& store) : store_(store) {
    store_.BeginWrite();
}

StateStore::Transaction::~Transaction() {
    if (done_) return;
    store_.transaction_ = TransactionKind::kNone;
    store_.Forget();
    sqlite3_exec(store_.db_, "ROLLBACK", nullptr, nullptr, nullptr);
}

void StateStore::Transaction::Commit() {
    store_.EndTransaction("COMMIT");
    done_ = true;
}

void StateStore::LoadSections() {
    if (sectionsLoaded_) return;
    BeginRead();
    // A row without a name (every section has one) stands for an injected failure; the
    // failures are then read by a statement of their own, which almost no invocation needs.
    Use query(Statement("SELECT name, value FROM section UNION ALL SELECT NULL, NULL FROM fault"));
    sections_.clear();
    faults_.clear();
    bool faults = false;
    int step;
    while ((step = sqlite3_step(query)) == SQLITE_ROW) {
        if (sqlite3_column_type(query, 0) == SQLITE_NULL) {
            faults = true;
            continue;
        }
        Section& section = sections_.emplace_back();
        Read(query, 0, section.name);
        Read(query, 1, section.text);
    }
    if (step != SQLITE_DONE) Fail("cannot read");
    if (faults) {
        Use failures(Statement("SELECT op, call, message FROM fault ORDER BY op, call"));
        while ((step = sqlite3_step(failures)) == SQLITE_ROW) {
            Fault& fault = faults_.emplace_back();
            Read(failures, 0, fault.op);
            Read(failures, 1, fault.call);
            Read(failures, 2, fault.message);
        }
        if (step != SQLITE_DONE) Fail("cannot read the failures");
    }
    sectionsLoaded_ = true;
}

StateStore::Section* StateStore::FindSection(std::string_view name) {
    LoadSections();
    for (Section& section : sections_) {
        if (section.name == name) return &section;
    }
    return nullptr;
}

const Json& StateStore::ReadSection(std::string_view name) {
    Section* section = FindSection(name);
    if (section == nullptr) Fail("no section " + std::string(name));
    if (!section->value) {
        section->value = std::make_unique<Json>(Json::parse(section->text));
        std::string().swap(section->text);
    }
    return *section->value;
}

Json StateStore::ReadExtra(std::string_view name) {
    Section* section = FindSection(name);
    if (section == nullptr) return Json();
    if (section->value) return *section->value;
    return Json::parse(section->text, nullptr, false);
}

void StateStore::WriteSection(std::string_view name, const Json& value) {
    Use statement(Statement("INSERT OR REPLACE INTO section(name, value) VALUES(?1, ?2)"));
    sqlite3_bind_text(statement, 1, name.data(), static_cast<int>(name.size()), SQLITE_STATIC);
    Bind(statement, 2, JsonText(value));
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write " + std::string(name));
    // Until the sections are read, the next read finds the row written.
    if (!sectionsLoaded_) return;
    Section* section = FindSection(name);
    if (section == nullptr) {
        section = &sections_.emplace_back();
        section->name = name;
    }
    section->text.clear();
    if (section->value) {
        *section->value = value;
    } else {
        section->value = std::make_unique<Json>(value);
    }
}

namespace {

// Finds a disk by UUID in DiskIndex. Every bit of the UUID reaches the low bits that pick the
// slot: the UUIDs of a populated host differ only in their last bytes.
struct UuidKey {
    const std::vector<HostCtl::Mesk::Uuid>& uuids;
    const HostCtl::Mesk::Uuid& uuid;
    size_t Hash() const {
        uint64_t low, high;
        std::memcpy(&low, uuid.bytes, 8);
        std::memcpy(&high, uuid.bytes + 8, 8);
        uint64_t mixed = low ^ (high * 0x9e3779b97f4a7c15);
        mixed = (mixed ^ (mixed >> 33)) * 0xff51afd7ed558ccd;
        mixed = (mixed ^ (mixed >> 33)) * 0xc4ceb9fe1a85ec53;
        return size_t(mixed ^ (mixed >> 33));
    }
    bool Is(uint32_t position) const { return uuids[position] == uuid; }
};

// Finds a disk by device name.
struct NameKey {
    const std::vector<Disk>& disks;
    std::string_view name;
    size_t Hash() const { return std::hash<std::string_view>()(name); }
    bool Is(uint32_t position) const { return disks[position].name == name; }
};

}  // namespace

void StateStore::LoadDisks() {
    if (disksLoaded_) return;
    BeginRead();
    static const std::string select = "SELECT " + DiskColumns() + " FROM disk ORDER BY position";
    Use query(Statement(select.c_str()));
    disks_.clear();
    diskUuids_.clear();
    int step;
    while ((step = sqlite3_step(query)) == SQLITE_ROW) {
        Disk& disk = disks_.emplace_back();
        int column = 0;
        ForEachDiskField(
            disk, [&](const char*, auto& member, DiskCheck) { Read(query, column++, member); });
        HostCtl::Mesk::Uuid& uuid = diskUuids_.emplace_back();
        if (!ParseUuid(disk.uuid.data(), disk.uuid.size(), uuid)) uuid = HostCtl::Mesk::Uuid();
    }
    if (step != SQLITE_DONE) Fail("cannot read the disks");
    byUuid_.Reserve(disks_.size());
    byDevice_.Reserve(disks_.size());
    for (uint32_t i = 0; i < disks_.size(); ++i) {
        // A text that is not a UUID matches no UUID, not even the nil one.
        if (diskUuids_[i] != HostCtl::Mesk::Uuid() || IsUuidText(disks_[i].uuid)) {
            byUuid_.Add(i, UuidKey{diskUuids_, diskUuids_[i]});
        }
        if (disks_[i].lun) byDevice_.Add(i, NameKey{disks_, disks_[i].name});
    }
    disksLoaded_ = true;
}

const std::vector<Disk>& StateStore::Disks() {
    LoadDisks();
    return disks_;
}

const std::vector<HostCtl::Mesk::Uuid>& StateStore::DiskUuids() {
    LoadDisks();
    return diskUuids_;
}

const Disk* StateStore::FindDisk(const HostCtl::Mesk::Uuid& uuid) {
    LoadDisks();
    int64_t position = byUuid_.Find(UuidKey{diskUuids_, uuid});
    return position < 0 ? nullptr : &disks_[size_t(position)];
}

const Disk* StateStore::FindDisk(const std::string& uuid) {
    HostCtl::Mesk::Uuid parsed;
    if (!ParseUuid(uuid.data(), uuid.size(), parsed)) return nullptr;
    return FindDisk(parsed);
}

const Disk* StateStore::FindDevice(const std::string& name) {
    LoadDisks();
    int64_t position = byDevice_.Find(NameKey{disks_, name});
    return position < 0 ? nullptr : &disks_[size_t(position)];
}

void StateStore::DiskIndex::Reserve(size_t count) {
    size_t size = 16;
    while (size < 2 * count) size *= 2;
    slots_.assign(size, 0);
}

template <class Key>
void StateStore::DiskIndex::Add(uint32_t position, const Key& key) {
    size_t mask = slots_.size() - 1;
    size_t slot = key.Hash() & mask;
    while (slots_[slot] != 0) {
        if (key.Is(slots_[slot] - 1)) return;
        slot = (slot + 1) & mask;
    }
    slots_[slot] = position + 1;
}

template <class Key>
int64_t StateStore::DiskIndex::Find(const Key& key) const {
    if (slots_.empty()) return -1;
    size_t mask = slots_.size() - 1;
    for (size_t slot = key.Hash() & mask; slots_[slot] != 0; slot = (slot + 1) & mask) {
        if (key.Is(slots_[slot] - 1)) return slots_[slot] - 1;
    }
    return -1;
}

void StateStore::WriteDisk(const Disk& disk) {
    static const std::string update =
        "UPDATE disk SET (" + DiskColumns() + ") = (" + DiskParameters(2) + ") WHERE uuid = ?1";
    Use statement(Statement(update.c_str()));
    Bind(statement, 1, disk.uuid);
    BindDisk(statement, 2, disk);
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write a disk");
    // The cache follows, unless the disk moves in an index.
    const Disk* cached = disksLoaded_ ? FindDisk(disk.uuid) : nullptr;
    if (cached != nullptr && cached->name == disk.name && cached->lun == disk.lun) {
        disks_[static_cast<size_t>(cached - disks_.data())] = disk;
    } else {
        disksLoaded_ = false;
    }
}

void StateStore::DeleteDisk(const std::string& uuid) {
    Use statement(Statement("DELETE FROM disk WHERE uuid = ?1"));
    Bind(statement, 1, uuid);
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot delete a disk");
    disksLoaded_ = false;
}

Json StateStore::Dump() {
    Json host;
    for (const char* name : kSections) host[name] = ReadSection(name);
    Json disks = Json::array();
    for (const Disk& disk : Disks()) disks.push_back(DiskDocument(disk));
    host["storage"]["disks"] = std::move(disks);
    return host;
}

void StateStore::Replace(const Json& host) {
    Exec("DELETE FROM section; DELETE FROM disk;");
    Forget();
    for (const char* name : kSections) {
        Json value = host.at(name);
        if (value.is_object()) value.erase("disks");
        WriteSection(name, value);
    }
    WriteSection(kVersionSection, kDocumentVersion);
    static const std::string insert =
        "INSERT INTO disk(position, " + DiskColumns() + ") VALUES(?1, " + DiskParameters(2) + ")";
    Use statement(Statement(insert.c_str()));
    int64_t position = 0;
    for (const Json& disk : host.at("storage").at("disks")) {
        sqlite3_bind_int64(statement, 1, position++);
        BindDisk(statement, 2, DiskFromDocument(disk));
        if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write a disk");
        sqlite3_reset(statement);
    }
}

int64_t StateStore::DocumentVersion() {
    // A number's text, as written; a state of version 1 has none.
    Section* section = FindSection(kVersionSection);
    if (section == nullptr) return 1;
    if (section->value) return section->value->is_number() ? section->value->get<int64_t>() : 0;
    return std::strtoll(section->text.c_str(), nullptr, 10);
}

std::vector<Fault> StateStore::ReadFaults() {
    LoadSections();
    return faults_;
}

void StateStore::SetFault(const Fault& fault) {
    Use statement(Statement("INSERT OR REPLACE INTO fault(op, call, message) VALUES(?1, ?2, ?3)"));
    Bind(statement, 1, fault.op);
    Bind(statement, 2, fault.call);
    Bind(statement, 3, fault.message);
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot write a failure");
    if (!sectionsLoaded_) return;
    auto at = std::lower_bound(faults_.begin(), faults_.end(), fault, FaultOrder);
    if (at != faults_.end() && at->op == fault.op && at->call == fault.call) {
        at->message = fault.message;
    } else {
        faults_.insert(at, fault);
    }
}

void StateStore::ClearFaults(const std::string& op) {
    if (op.empty()) {
        Exec("DELETE FROM fault");
        faults_.clear();
        return;
    }
    Use statement(Statement("DELETE FROM fault WHERE op = ?1"));
    Bind(statement, 1, op);
    if (sqlite3_step(statement) != SQLITE_DONE) Fail("cannot clear a failure");
    faults_.erase(std::remove_if(faults_.begin(), faults_.end(),
                                 [&](const Fault& fault) { return fault.op == op; }),
                  faults_.end());
}

}  // namespace HostCtlSim
