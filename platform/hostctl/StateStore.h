// The simulated host's state database (SQLite): every read and write of the host's state.
//
// The database holds the host document of StateDocument.h: each small top-level key is one
// row of `section` (its JSON text), and each disk one row of `disk`, a column per field, so
// that a listing reads thousands of disks without parsing a JSON text for each. It also holds
// the injected failures. Its application id and schema version mark it as a simulated host;
// any other file is refused untouched.
//
// A process that only reads opens the database read-only and writes nothing: the first read
// begins one read transaction, which lasts until the process changes something or ends, and
// everything it reads is kept, so that all reads of an invocation agree and each is read once.
// The first read takes every section in one statement, which also tells whether any failure is
// injected, since each statement prepared costs a short command more than reading the few rows
// does; a section's JSON text is parsed when it is first asked for.
// Every change is one BEGIN IMMEDIATE transaction on a read-write connection, so that
// concurrent processes queue up behind a busy timeout and a killed process leaves the state as
// it was before or after the change; reads after a change see it.
#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "StateDocument.h"
#include "hostctl/MeskTypes.h"

namespace HostCtlSim {

// A failure injected into one operation: every call (call 0) or only the Nth of each invocation.
struct Fault {
    std::string op;
    int64_t call = 0;
    std::string message;
};

class StateStore {
  public:
    // Nothing is opened before Open().
    explicit StateStore(std::string path);
    ~StateStore();
    StateStore(const StateStore&) = delete;
    StateStore& operator=(const StateStore&) = delete;

    // Opens the state for reading. A path that does not exist yet (or an empty file) becomes a
    // fresh host, made whole before anyone else can see it; returns true iff this call made it.
    // Throws MeskCtlException, naming the path and what is wrong, for anything that is not a
    // simulated host of this version; such a file is left as it was.
    // `makeFiles`, when given, makes the host's files once the new host's tables are ready and
    // before anyone can see it, so that no process finds the host without its files; when it
    // throws, no host is made.
    bool Open(const std::function<void()>& makeFiles = {});
    // Like Open, but a host made by an older hostsim is emptied, to be replaced whole.
    bool OpenForReplacement(const std::function<void()>& makeFiles = {});
    const std::string& Path() const { return path_; }
    // Whether the connection open is a read-write one, as it is from this process's first
    // change on.
    bool IsWritable() const { return writable_; }

    // A change: BEGIN IMMEDIATE on a read-write connection, rolled back unless committed.
    // Reads within it see the state as it is now. Throws MeskCtlException ("cannot change the
    // simulated host: PATH is read-only for this user") when the user may not write the state.
    class Transaction {
      public:
        explicit Transaction(StateStore& store);
        ~Transaction();
        void Commit();

      private:
        StateStore& store_;
        bool done_ = false;
    };

    // Reading. References stay valid until the next change of the same item or the end of the
    // transaction.
    // One top-level key of the document (not "storage.disks" nor "services").
    const Json& ReadSection(std::string_view name);
    // A row of the section table that is not part of the document, or null when there is none.
    Json ReadExtra(std::string_view name);
    // Every disk, in inventory order.
    const std::vector<Disk>& Disks();
    // The UUID of each disk of Disks(), at the same position; a nil UUID where the disk's
    // text is not a UUID (only a state changed by hand has one).
    const std::vector<HostCtl::Mesk::Uuid>& DiskUuids();
    // The disk with that UUID, or nullptr.
    const Disk* FindDisk(const HostCtl::Mesk::Uuid& uuid);
    const Disk* FindDisk(const std::string& uuid);  // its text form
    // The disk for which the host has a device of that name, or nullptr.
    const Disk* FindDevice(const std::string& name);
    // The whole host without its services.
    Json Dump();
    std::vector<Fault> ReadFaults();

    // Changing, within a Transaction.
    void WriteSection(std::string_view name, const Json& value);  // also an extra row
    void WriteDisk(const Disk& disk);                             // the disk of that UUID
    void DeleteDisk(const std::string& uuid);
    void Replace(const Json& host);  // by a normalized document
    void SetFault(const Fault& fault);
    // Forgets the injected failures of `op`, or every one when `op` is empty.
    void ClearFaults(const std::string& op = std::string());

  private:
    enum class Kind { kMissing, kHost, kOlderHost };
    Kind Inspect();
    bool OpenAs(bool replacing, const std::function<void()>& makeFiles);
    int64_t DocumentVersion();
    void AddNewKeys();
    bool Create(const std::function<void()>& makeFiles);
    void Connect(const std::string& path, bool writable);
    void Disconnect();
    void BeginRead();
    void BeginWrite();
    void EndTransaction(const char* sql);
    void Forget();
    void LoadSections();
    void LoadDisks();
    // An index of disks_ by a key: open addressing over their positions, so that indexing
    // thousands of disks allocates once. `Key` gives the hash of a position's key and tells
    // whether a position's key is the one sought.
    class DiskIndex {
      public:
        void Clear() { slots_.clear(); }
        void Reserve(size_t count);  // before the first Add
        // Of positions with equal keys, the first added is found.
        template <class Key>
        void Add(uint32_t position, const Key& key);
        // The position with that key, or -1.
        template <class Key>
        int64_t Find(const Key& key) const;

      private:
        std::vector<uint32_t> slots_;  // a position plus one; 0 in an empty slot
    };
    sqlite3_stmt* Statement(const char* sql);
    int64_t QueryNumber(const char* sql);  // the first column of the first row
    [[noreturn]] void RefuseChange();
    void Exec(const char* sql);
    [[noreturn]] void Fail(const std::string& what);

    std::string path_;
    sqlite3* db_ = nullptr;
    bool writable_ = false;
    enum class TransactionKind { kNone, kReading, kWriting };
    TransactionKind transaction_ = TransactionKind::kNone;
    // Prepared statements by their text's address: a handful, searched in order.
    std::vector<std::pair<const char*, sqlite3_stmt*>> statements_;

    // What the current transaction has read.
    struct Section {
        std::string name;
        std::string text;             // as read; empty once parsed or written
        std::unique_ptr<Json> value;  // parsed on first use; its own allocation, so that
                                      // references to it outlive a section added later
    };
    Section* FindSection(std::string_view name);
    bool sectionsLoaded_ = false;  // sections_ and faults_ hold every row
    std::vector<Section> sections_;
    std::vector<Fault> faults_;
    bool disksLoaded_ = false;
    std::vector<Disk> disks_;
    std::vector<HostCtl::Mesk::Uuid> diskUuids_;
    // Indexes of disks_, by UUID and, of the disks with a device, by name.
    DiskIndex byUuid_;
    DiskIndex byDevice_;
};

}  // namespace HostCtlSim
