// The simulated host's state database (SQLite).
//
// The database holds the host document of StateDocument.h, cut into sections: each top-level
// key is one row of `section` (its JSON text), except the disks, which are rows of `disk`
// indexed by UUID, by device name and by disk group, so that one disk is found without reading
// the inventory. It also holds the injected failures and the call log of the last invocation.
//
// Readers need no lock (WAL mode); every change runs in one BEGIN IMMEDIATE transaction, so
// that concurrent processes queue up behind a busy timeout and a killed process leaves the
// state as it was before or after the change.
#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "StateDocument.h"

namespace HostCtlSim {

// One operation recorded in the call log.
struct CallRecord {
    int64_t time = 0;   // nanoseconds since the epoch
    std::string entry;  // {"op": name, "args": [...]} and "error" when the call threw
};

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

    // Opens the database, creating the file and its parent directories and filling it with
    // the default host when it holds no host yet. Returns true iff it made the default host.
    // Throws MeskCtlException when the database cannot be used.
    bool Open();
    const std::string& Path() const { return path_; }

    // A BEGIN IMMEDIATE transaction, rolled back unless committed.
    class Transaction {
      public:
        explicit Transaction(StateStore& store);
        ~Transaction();
        void Commit();

      private:
        StateStore& store_;
        bool done_ = false;
    };

    // One top-level key of the document (not "storage.disks" nor "services").
    Json ReadSection(const std::string& name);
    void WriteSection(const std::string& name, const Json& value);

    // Disks, in inventory order where several are returned.
    struct Lun {
        std::string name;
        std::string uuid;
    };
    std::vector<Lun> ReadLuns();                      // disks for which the host has a device
    std::vector<std::string> ReadGroupedDiskUuids();  // disks held in a disk group
    bool ReadDisk(const std::string& uuid, Json& disk);
    bool ReadDiskRecord(const std::string& uuid, std::string& record);  // its JSON text
    bool ReadDiskByName(const std::string& name, Json& disk);           // a disk with a device
    std::vector<Json> ReadDiskGroup(const std::string& groupUuid);
    void UpdateDisk(const Json& disk);  // by its UUID
    void DeleteDisk(const std::string& uuid);

    // The whole host without its services, and its replacement by a normalized document.
    Json Dump();
    void Replace(const Json& host);  // within a transaction of the caller

    std::vector<Fault> ReadFaults();
    void SetFault(const Fault& fault);
    void ClearFaults();

    // Replaces the log of every other invocation by `calls`, or adds them to the log of the
    // same invocation.
    void AppendCalls(const std::string& invocation, const std::vector<CallRecord>& calls);
    std::vector<CallRecord> ReadCalls();
    void ClearCalls();

  private:
    bool Prepare();
    int SchemaVersion();
    sqlite3_stmt* Statement(const char* sql);
    void Exec(const char* sql);
    [[noreturn]] void Fail(const std::string& what);
    void InsertDisk(const Json& disk, int64_t position);

    std::string path_;
    sqlite3* db_ = nullptr;
    std::map<const char*, sqlite3_stmt*> statements_;
};

}  // namespace HostCtlSim
