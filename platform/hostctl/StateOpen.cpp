// Opening the simulated host's state: which files are a host, how a missing one is made,
// and the journal the database runs with. StateStore.cpp reads and writes its tables.
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <optional>
#include <type_traits>

#include "StateStore.h"
#include "hostctl/MeskCtlException.h"

using HostCtl::Lib::Mesk::MeskCtlException;

namespace HostCtlSim {

namespace {

// The database's marks: "hsim" as its application id, and the version of the tables below.
// Version 1 (the first hostsim's) set no application id.
const int32_t kApplicationId = 0x6873696d;
const int kSchemaVersion = 2;
const int kBusyTimeoutMs = 30000;

// The tables of this version, and the marks.
const std::string& Schema() {
    static const std::string schema = [] {
        std::string columns;
        Disk sample;
        ForEachDiskField(sample, [&](const char* key, auto& member, DiskCheck) {
            bool text = std::is_same_v<std::decay_t<decltype(member)>, std::string>;
            columns += std::string(", ") + key + (text ? " TEXT NOT NULL" : " INTEGER NOT NULL");
        });
        std::string sql =
            "CREATE TABLE section(name TEXT PRIMARY KEY, value TEXT NOT NULL) WITHOUT ROWID;";
        sql += "CREATE TABLE disk(position INTEGER PRIMARY KEY" + columns + ", UNIQUE(uuid));";
        sql += "CREATE TABLE fault(op TEXT NOT NULL, call INTEGER NOT NULL,";
        sql += " message TEXT NOT NULL, PRIMARY KEY(op, call));";
        sql += "PRAGMA application_id=" + std::to_string(kApplicationId) + ";";
        sql += "PRAGMA user_version=" + std::to_string(kSchemaVersion) + ";";
        return sql;
    }();
    return schema;
}

void MakeDirectories(const std::string& path) {
    for (size_t slash = path.find('/', 1); slash != std::string::npos;
         slash = path.find('/', slash + 1)) {
        mkdir(path.substr(0, slash).c_str(), 0755);
    }
}

std::string DirectoryOf(const std::string& path) {
    size_t slash = path.rfind('/');
    if (slash == std::string::npos) return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

class Descriptor {
  public:
    explicit Descriptor(int fd) : fd_(fd) {}
    ~Descriptor() {
        if (fd_ >= 0) close(fd_);
    }
    int get() const { return fd_; }

  private:
    int fd_;
};

}  // namespace

// The journal: WAL, kept. Many short readers and few writers use the state at once: in WAL
// mode readers never wait for a writer nor a writer for readers, and a commit needs no sync
// (synchronous=NORMAL syncs only when the log is copied back into the database; a killed
// process cannot corrupt it, a machine crash can lose the last changes). The log and its index
// are kept between processes (SQLITE_FCNTL_PERSIST_WAL) instead of being made and removed by
// each: a reader that may not create files (another user, a read-only file system) still
// opens the state, and readers create and delete nothing. Readers never copy the log back
// (SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE; a read-only connection could not); a writer that closes
// last does, and cuts the log to nothing (journal_size_limit), so that the state at rest is
// the database file alone and a reader without a writable index has no log to scan.
void StateStore::Connect(const std::string& path, bool writable) {
    // Set once, before SQLite's first use in the process, for short-lived processes: no
    // memory statistics (a mutex around every allocation), no page cache laid out in advance,
    // which every invocation would otherwise pay for in page faults, and no mutexes at all:
    // the simulated host serves one thread (nothing of it locks), and SQLite's own locking
    // only cost each invocation its mutexes' setup and a call around every step. (Debian's
    // SQLite is built without a lookaside, so there is none to size.)
    static const bool configured = [] {
        sqlite3_config(SQLITE_CONFIG_SINGLETHREAD);
        sqlite3_config(SQLITE_CONFIG_MEMSTATUS, 0);
        sqlite3_config(SQLITE_CONFIG_PAGECACHE, nullptr, 0, 0);
        return true;
    }();
    (void)configured;
    int flags = (writable ? SQLITE_OPEN_READWRITE : SQLITE_OPEN_READONLY) | SQLITE_OPEN_NOMUTEX;
    if (sqlite3_open_v2(path.c_str(), &db_, flags, nullptr) != SQLITE_OK) {
        std::string detail = db_ != nullptr ? sqlite3_errmsg(db_) : "out of memory";
        Disconnect();
        throw MeskCtlException("Simulated host state " + path_ + ": cannot open: " + detail);
    }
    writable_ = writable;
    sqlite3_extended_result_codes(db_, 1);
    sqlite3_busy_timeout(db_, kBusyTimeoutMs);
    if (!writable) {
        sqlite3_db_config(db_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
        return;
    }
    // SQLite opens a file that the user may not write read-only, without a word.
    if (sqlite3_db_readonly(db_, "main") == 1) {
        Disconnect();
        RefuseChange();
    }
    if (path == path_) {
        int persist = 1;
        sqlite3_file_control(db_, "main", SQLITE_FCNTL_PERSIST_WAL, &persist);
    }
    Exec("PRAGMA synchronous=NORMAL; PRAGMA journal_size_limit=0");
}

void StateStore::Disconnect() {
    for (auto& entry : statements_) sqlite3_finalize(entry.second);
    statements_.clear();
    if (db_ != nullptr) sqlite3_close(db_);
    db_ = nullptr;
    writable_ = false;
    transaction_ = TransactionKind::kNone;
    Forget();
}

StateStore::Kind StateStore::Inspect() {
    if (path_ == ":memory:") {
        throw MeskCtlException("Simulated host state " + path_ +
                               " is an in-memory database, where every change would vanish; "
                               "name a file");
    }
    struct stat file {};
    if (stat(path_.c_str(), &file) != 0) {
        if (errno == ENOENT) return Kind::kMissing;
        throw MeskCtlException("Simulated host state " + path_ +
                               " cannot be read: " + std::strerror(errno));
    }
    if (!S_ISREG(file.st_mode)) {
        throw MeskCtlException("Simulated host state " + path_ + " is not a file");
    }
    if (file.st_size == 0) return Kind::kMissing;
    bool marked = false;  // the file's header bears our application id
    {
        // The database header's marks are read before SQLite sees the file: opening another
        // program's database in WAL mode would leave a log and an index beside it.
        Descriptor fd(open(path_.c_str(), O_RDONLY | O_CLOEXEC));
        unsigned char header[100] = {};
        if (fd.get() < 0 || read(fd.get(), header, sizeof header) < 0) {
            throw MeskCtlException("Simulated host state " + path_ +
                                   " cannot be read: " + std::strerror(errno));
        }
        if (std::memcmp(header, "SQLite format 3", 16) != 0) {
            throw MeskCtlException("Simulated host state " + path_ + " is not an SQLite database");
        }
        auto mark = [&](size_t offset) {  // big-endian, at its offset in the header
            return int64_t(header[offset]) << 24 | header[offset + 1] << 16 |
                   header[offset + 2] << 8 | header[offset + 3];
        };
        // Only the first hostsim's hosts have no application id; their version is 1.
        marked = mark(68) == kApplicationId;
        if (!marked && (mark(68) != 0 || mark(60) != 1)) {
            throw MeskCtlException("Simulated host state " + path_ +
                                   " is another program's SQLite database, not a simulated host");
        }
    }
    Connect(path_, false);
    // The read transaction that begins here is the one every later read of this process
    // answers from, until it changes something.
    BeginRead();
    // The header above is the file's; the log may hold a newer one. Of the marks, only the
    // version changes in place (a newer hostsim replacing the tables), and the application id
    // only from none (the first layout's) to ours, so an id found in the file stands.
    int64_t version = QueryNumber("PRAGMA user_version");
    int64_t applicationId = marked ? kApplicationId : QueryNumber("PRAGMA application_id");
    bool firstLayout =
        applicationId == 0 && version == 1 &&
        QueryNumber("SELECT count(*) FROM sqlite_master WHERE type = 'table' AND name = 'section'");
    if (applicationId == kApplicationId && version == kSchemaVersion) return Kind::kHost;
    Disconnect();
    if ((applicationId == kApplicationId && version < kSchemaVersion) || firstLayout) {
        return Kind::kOlderHost;
    }
    if (applicationId == kApplicationId) {
        throw MeskCtlException("Simulated host state " + path_ + " was made by a newer hostsim");
    }
    throw MeskCtlException("Simulated host state " + path_ +
                           " is another program's SQLite database, not a simulated host");
}

bool StateStore::Open(const std::function<void()>& makeFiles) {
    return db_ == nullptr && OpenAs(false, makeFiles);
}

bool StateStore::OpenForReplacement(const std::function<void()>& makeFiles) {
    return db_ == nullptr && OpenAs(true, makeFiles);
}

bool StateStore::OpenAs(bool replacing, const std::function<void()>& makeFiles) {
    switch (Inspect()) {
        case Kind::kHost: {
            int64_t version = DocumentVersion();
            if (version > kDocumentVersion) {
                Disconnect();
                throw MeskCtlException("Simulated host state " + path_ +
                                       " was made by a newer hostsim");
            }
            if (version < kDocumentVersion && !replacing) AddNewKeys();
            return false;
        }
        case Kind::kMissing: {
            bool made = Create(makeFiles);
            if (Inspect() != Kind::kHost) Fail("cannot read the host just made");
            return made;
        }
        case Kind::kOlderHost:
            break;
    }
    if (!replacing) {
        throw MeskCtlException("Simulated host state " + path_ +
                               " was made by an older hostsim; run 'hostsim reset'");
    }
    // Its tables give way to this version's, in one change.
    Connect(path_, true);
    Transaction transaction(*this);
    Exec(
        "DROP TABLE IF EXISTS call_log; DROP TABLE IF EXISTS fault; DROP TABLE IF EXISTS disk;"
        "DROP TABLE IF EXISTS section;");
    Exec(Schema().c_str());
    Replace(NormalizeHost(DefaultHost()));
    if (makeFiles) makeFiles();
    transaction.Commit();
    return true;
}

// A state written by an older build lacks the keys added since: they get their defaults, in
// one change, which the process that makes it reports once.
void StateStore::AddNewKeys() {
    auto refuse = [&](const std::string& why) {
        throw MeskCtlException("Simulated host state " + path_ + " was written by an older build" +
                               why + "; run 'hostsim reset'");
    };
    std::optional<Transaction> transaction;
    try {
        transaction.emplace(*this);
    } catch (const MeskCtlException& error) {
        refuse(" and cannot be brought up to date (" + std::string(error.what()) + ")");
    }
    if (DocumentVersion() >= kDocumentVersion) return;  // another process was first
    Json host = Dump();
    Json defaults = DefaultHost();
    host["services"] = defaults["services"];  // kept in the host's files
    std::vector<std::string> added = AddMissingKeys(host, defaults);
    try {
        host = NormalizeHost(host);
    } catch (const DocumentError& error) {
        refuse(" that this one cannot read: " + std::string(error.what()));
    }
    Replace(host);
    transaction->Commit();
    if (added.empty()) return;
    std::string list;
    for (const std::string& key : added) list += (list.empty() ? "" : ", ") + key;
    std::fprintf(stderr,
                 "Simulated host state %s was written by an older build; added with their "
                 "defaults: %s\n",
                 path_.c_str(), list.c_str());
}

// The host is made whole in a file of its own, then renamed into place, so that no process
// ever sees half a host; a lock on the directory makes the processes that find no host at
// once make it one at a time, and all but the first find it made, files included.
bool StateStore::Create(const std::function<void()>& makeFiles) {
    MakeDirectories(path_);
    auto refuse = [&](const char* what) {
        throw MeskCtlException("Simulated host state " + path_ + ": cannot " + what + ": " +
                               std::strerror(errno));
    };
    Descriptor directory(open(DirectoryOf(path_).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (directory.get() < 0) refuse("create it");
    while (flock(directory.get(), LOCK_EX) != 0) {
        if (errno != EINTR) refuse("lock its directory");
    }
    struct stat file {};
    if (stat(path_.c_str(), &file) == 0 && file.st_size > 0) return false;
    // The log and index of a state that was removed would be taken for the new one's.
    unlink((path_ + "-wal").c_str());
    unlink((path_ + "-shm").c_str());

    std::string temporary = path_ + ".new-XXXXXX";
    {
        Descriptor fd(mkstemp(&temporary[0]));
        if (fd.get() < 0) refuse("create it");
        fchmod(fd.get(), 0644);
    }
    try {
        Connect(temporary, true);
        Exec("PRAGMA journal_mode=WAL");
        Exec("BEGIN IMMEDIATE");
        Exec(Schema().c_str());
        Replace(NormalizeHost(DefaultHost()));
        Exec("COMMIT");
        Disconnect();  // copies the log into the file and removes it
        if (makeFiles) makeFiles();
        if (rename(temporary.c_str(), path_.c_str()) != 0) refuse("create it");
    } catch (...) {
        Disconnect();
        for (const char* suffix : {"", "-wal", "-shm"}) unlink((temporary + suffix).c_str());
        throw;
    }
    // The log and its index, which stay from now on (see Connect).
    Connect(path_, true);
    Exec("SELECT count(*) FROM section");
    Disconnect();
    return true;
}

void StateStore::RefuseChange() {
    throw MeskCtlException("cannot change the simulated host: " + path_ +
                           " is read-only for this user");
}

}  // namespace HostCtlSim
