#include "install/platform/embedded/registry.h"

#include <unistd.h>

#include <algorithm>

#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::int64_t kMachineId = 1;
constexpr std::int64_t kUsersId = 2;
constexpr std::int64_t kNoKey = -1;  // the caller's key while it does not exist; it has no subkeys
constexpr std::uint32_t kRoots = 3;  // the first slots of the open keys
constexpr std::uint32_t kUserSlot = 2;
constexpr std::size_t kFewSubkeys = 64;
constexpr std::size_t kReadAhead = 64;  // rows of the statements that read ahead
constexpr std::int64_t kPageSize = 4096;
constexpr std::int64_t kLogLimit = std::int64_t{256} * 1024;  // size of the log that a run may leave to the next one

// clang-format off
// Each statement by its name.
#define KZ7_STATEMENTS(SQL) \
    SQL(findKey,           "SELECT id FROM key WHERE parent = ? AND fold = ?") \
    SQL(addKey,            "INSERT INTO key (parent, fold, name, class) VALUES (?, ?, ?, ?)") \
    SQL(keyExists,         "SELECT 1 FROM key WHERE id = ?") \
    SQL(nextKeys,          "SELECT id, fold, name, class FROM key WHERE parent = ? AND fold >= ? ORDER BY fold LIMIT 64 OFFSET ?") \
    SQL(hasSubkey,         "SELECT 1 FROM key WHERE parent = ? LIMIT 1") \
    SQL(keyAbove,          "SELECT parent, fold FROM key WHERE id = ?") \
    SQL(deleteKey,         "DELETE FROM key WHERE id = ?") \
    SQL(deleteValues,      "DELETE FROM value WHERE key = ?") \
    SQL(getValue,          "SELECT type, data FROM value WHERE key = ? AND fold = ?") \
    SQL(highestPlace,      "SELECT coalesce(max(place), 0) FROM value WHERE key = ?") \
    SQL(setValue,          "INSERT INTO value (key, fold, name, type, data, place) VALUES (?, ?, ?, ?, ?, ?)" \
                           " ON CONFLICT (key, fold) DO UPDATE SET type = excluded.type, data = excluded.data") \
    SQL(deleteValue,       "DELETE FROM value WHERE key = ? AND fold = ?") \
    SQL(deletePlacedValue, "DELETE FROM value WHERE key = ? AND fold = ? RETURNING place") \
    SQL(nextValue,         "SELECT place, name, type, data FROM value WHERE key = ? AND place >= ? ORDER BY place LIMIT 1 OFFSET ?") \
    SQL(nextValueNames,    "SELECT place, name, type FROM value WHERE key = ? AND place >= ? ORDER BY place LIMIT 64 OFFSET ?")

#define KZ7_TEXT(name, text) text,
#define KZ7_NAME(name, text) name,
constexpr std::array kSql = {KZ7_STATEMENTS(KZ7_TEXT)};
// clang-format on

std::string userName() {
    return "S-1-22-1-" + std::to_string(geteuid());
}

}  // namespace

// clang-format off
enum class EmbeddedRegistry::Sql : std::size_t { KZ7_STATEMENTS(KZ7_NAME) };
// clang-format on

EmbeddedRegistry::EmbeddedRegistry(const std::string& directory, bool readOnly, FaultListener listener,
                                   const StoreReading& reading)
    : file_(directory, reading), readOnly_(readOnly), listener_(std::move(listener)) {
    static_assert(kSql.size() == std::tuple_size_v<decltype(statements_)>);
    for (const KeyId id : {kMachineId, kUsersId, kNoKey}) {
        OpenKey& root = open_.emplace_back();
        root.used = true;
        root.access = kKeyFull;
        root.id = id;
    }
}

EmbeddedRegistry::~EmbeddedRegistry() {
    endTransaction();
    if (logPages_ * kPageSize > kLogLimit) {
        // Does not wait: a program that uses the log now makes the checkpoint when it ends.
        sqlite3_busy_timeout(connection_.get(), 0);
        execute(connection_.get(), "PRAGMA wal_checkpoint(TRUNCATE)");
    }
}

Status EmbeddedRegistry::fail(const StoreFault& fault) {
    fault_ = fault.status;
    listener_(fault);
    return fault_;
}

Status EmbeddedRegistry::fail(int result) {
    if (fault_ != kSuccess) {
        return fault_;
    }
    if ((result & 0xFF) == SQLITE_TOOBIG) {
        return kInvalidParameter;
    }
    fault_ = kRegistryIoFailed;  // if there is no memory to explain it
    return fail(file_.explain(connection_.get(), result));
}

Status EmbeddedRegistry::begin() {
    if (fault_ != kSuccess || inTransaction_) {
        return fault_;
    }
    if (connection_ == nullptr) {
        const StoreFault fault = readOnly_ ? file_.openForReading(connection_) : file_.openForWriting(connection_);
        if (fault.status != kSuccess) {
            return fail(fault);
        }
        sqlite3_wal_hook(
            connection_.get(),
            [](void* pages, sqlite3*, const char*, int count) {
                *static_cast<std::int64_t*>(pages) = count;
                return SQLITE_OK;
            },
            &logPages_);
    }
    if (const int result = execute(connection_.get(), readOnly_ ? "BEGIN" : "BEGIN IMMEDIATE"); result != SQLITE_OK) {
        return fail(result);
    }
    int hasMoved = 0;
    sqlite3_file_control(connection_.get(), "main", SQLITE_FCNTL_HAS_MOVED, &hasMoved);
    if (!readOnly_ && hasMoved != 0) {
        return fail(StoreFault{kBusy, path(), "was replaced by another program while it was open"});
    }
    inTransaction_ = true;
    ++transaction_;
    childless_ = 0;
    placed_ = {};
    newKeys_ = {};
    return kSuccess;
}

void EmbeddedRegistry::endTransaction() {
    if (connection_ != nullptr && sqlite3_get_autocommit(connection_.get()) == 0) {
        execute(connection_.get(), "ROLLBACK");
    }
    if (commitFailed_) {
        commitFailed_ = !overwriteFailedCommit();
    }
    // A transaction that succeeded leaves no new keys behind. The ids of new keys of a failed one are used again for
    // later keys, also by other processes.
    for (OpenKey& open : open_) {
        open.deleted = open.deleted || (firstNew_ != 0 && open.id >= firstNew_);
    }
    firstNew_ = 0;
    inTransaction_ = false;
}

// A commit that fails at its sync has already written its frames, and the next process that opens the store would
// recover them from the log as a commit that succeeded. A second commit, which changes nothing, overwrites the first of
// them: the checksum of each frame covers the earlier ones, so the rest become invalid. It must not sync before it
// writes, because the sync is what fails. Frames of earlier commits, checkpoints and readers are not affected: the log
// continues after the last published frame, as for any writer. A process that is killed between the two commits leaves
// the failed one; no earlier write could prevent that.
bool EmbeddedRegistry::overwriteFailedCommit() {
    sqlite3* const connection = connection_.get();
    const bool overwritten = execute(connection, "PRAGMA synchronous = OFF; PRAGMA user_version = 1") == SQLITE_OK;
    // Again, so that it is on the disk if possible.
    execute(connection, "PRAGMA synchronous = FULL; PRAGMA user_version = 1");
    return overwritten;
}

Status EmbeddedRegistry::commit() {
    if (fault_ == kSuccess && inTransaction_) {
        const int result = execute(connection_.get(), "COMMIT");
        commitFailed_ = result != SQLITE_OK;
        if (commitFailed_) {
            fault_ = kRegistryIoFailed;  // if there is no memory to explain it
            StoreFault fault = file_.explain(connection_.get(), result);
            endTransaction();
            // Without space, not even the commit record was written.
            if (commitFailed_ && (result & 0xFF) != SQLITE_FULL) {
                fault.reason += "; the changes could not be taken back and may appear later";
            }
            fail(fault);
        } else {
            firstNew_ = 0;
        }
    }
    endTransaction();
    return std::exchange(fault_, kSuccess);
}

Status EmbeddedRegistry::image(std::string& bytes) {
    if (const Status status = begin(); status != kSuccess) {
        return status;
    }
    if (!file_.exists()) {
        return kFileNotFound;
    }
    // Not serialized directly: pages that cannot be read would become zeros.
    Connection memory;
    int result = copyToMemory(connection_.get(), memory);
    std::vector<std::string> damages;
    if (result == SQLITE_OK) {
        result = StoreFile::examine(memory.get(), damages);
    }
    if (result != SQLITE_OK) {
        return fail(result);
    }
    if (!damages.empty()) {
        return fail(StoreFault{kRegistryCorrupt, path(), damages.front()});
    }
    sqlite3_int64 size = 0;
    const std::unique_ptr<unsigned char, void (*)(void*)> content(sqlite3_serialize(memory.get(), "main", &size, 0),
                                                                  sqlite3_free);
    if (content == nullptr) {
        return fail(SQLITE_NOMEM);
    }
    bytes.assign(reinterpret_cast<const char*>(content.get()), static_cast<std::size_t>(size));
    return kSuccess;
}

Status EmbeddedRegistry::replaceBy(EmbeddedRegistry& content, std::string& kept) {
    endTransaction();
    statements_ = {};
    connection_.reset();
    logPages_ = 0;
    fault_ = kSuccess;
    const StoreFault fault = file_.replace(content.connection_.get(), kept);
    return fault.status == kSuccess ? kSuccess : fail(fault);
}

Status EmbeddedRegistry::examine(std::vector<std::string>& damages) {
    if (const Status status = begin(); status != kSuccess) {
        return status;
    }
    const int result = StoreFile::examine(connection_.get(), damages);
    return result == SQLITE_OK ? kSuccess : fail(result);
}

Status EmbeddedRegistry::use(const Work& work) {
    if (const Status status = begin(); status != kSuccess) {
        return status;
    }
    const int result = work(connection_.get());
    return result == SQLITE_OK ? kSuccess : fail(result);
}

void EmbeddedRegistry::useQuietly(const Work& work) {
    endTransaction();
    if (connection_ != nullptr && execute(connection_.get(), "BEGIN IMMEDIATE") == SQLITE_OK) {
        work(connection_.get());
        commitFailed_ = execute(connection_.get(), "COMMIT") != SQLITE_OK;
        endTransaction();
    }
}

Query EmbeddedRegistry::query(Sql which) {
    Statement& owner = statements_[static_cast<std::size_t>(which)];
    int result = SQLITE_OK;
    if (owner == nullptr) {
        sqlite3_stmt* prepared = nullptr;
        result = sqlite3_prepare_v3(connection_.get(), kSql[static_cast<std::size_t>(which)], -1,
                                    SQLITE_PREPARE_PERSISTENT, &prepared, nullptr);
        owner.reset(prepared);
    }
    return {owner.get(), result};
}

EmbeddedRegistry::OpenKey* EmbeddedRegistry::slotOf(KeyHandle handle) {
    switch (handle) {
        case KeyHandle::localMachine:
            return open_.data();
        case KeyHandle::users:
            return &open_[1];
        case KeyHandle::currentUser:
            return &open_[2];
        default:
            break;
    }
    const auto number = static_cast<std::uint64_t>(handle);
    const std::size_t slot = number & 0xFFFFFFFF;
    const std::uint64_t generation = number >> 32;
    if (generation == 0 || slot >= open_.size() || !open_[slot].used || open_[slot].generation != generation) {
        return nullptr;
    }
    return &open_[slot];
}

KeyHandle EmbeddedRegistry::giveOut(KeyId id, AccessMask access) {
    if (free_.empty()) {
        open_.emplace_back();
        // Closes a key without an allocation: owners do it during stack unwinding.
        free_.reserve(open_.capacity());
        free_.push_back(static_cast<std::uint32_t>(open_.size() - 1));
    }
    const std::uint32_t slot = free_.back();
    free_.pop_back();
    const std::uint32_t generation = open_[slot].generation + 1;
    open_[slot] = OpenKey{};
    open_[slot].used = true;
    open_[slot].generation = generation;
    open_[slot].access = grantedAccess(access);
    open_[slot].id = id;
    open_[slot].checkedIn = transaction_;
    return static_cast<KeyHandle>(std::uint64_t{generation} << 32 | slot);
}

Status EmbeddedRegistry::closeKey(KeyHandle key) {
    OpenKey* open = slotOf(key);
    if (open == nullptr) {
        return kInvalidHandle;
    }
    const auto slot = static_cast<std::uint32_t>(open - open_.data());
    if (slot >= kRoots) {
        open->used = false;
        free_.push_back(slot);
    }
    return kSuccess;
}

Status EmbeddedRegistry::keyOf(KeyHandle handle, AccessMask needed, OpenKey*& open) {
    OpenKey* found = slotOf(handle);
    if (found == nullptr) {
        return kInvalidHandle;
    }
    if (const Status status = begin(); status != kSuccess) {
        return status;
    }
    if (found->checkedIn != transaction_) {
        // Another process may have written in the meantime.
        found->keys = {};
        found->values = {};
        if (const Status status = lookUp(*found); status != kSuccess) {
            return status;
        }
        found->checkedIn = transaction_;
    }
    if (found->deleted) {
        return kKeyDeleted;
    }
    if ((found->access & needed) != needed) {
        return kAccessDenied;
    }
    open = found;
    return kSuccess;
}

Status EmbeddedRegistry::lookUp(OpenKey& open) {
    if (&open == &open_[kUserSlot]) {  // found by its name, because it may not exist
        open.id = kNoKey;
        open.deleted = false;
        const Status status = child(kUsersId, userName(), open.id);
        return isNotFound(status) ? kSuccess : status;
    }
    if (!open.deleted) {
        const int result = query(Sql::keyExists).bind(open.id).step();
        if (result != SQLITE_ROW && result != SQLITE_DONE) {
            return fail(result);
        }
        open.deleted = result == SQLITE_DONE;
    }
    return kSuccess;
}

// Deliberate: only a write creates the caller's key; a read must not change the store.
Status EmbeddedRegistry::makeUser(OpenKey& open) {
    if (open.id != kNoKey) {
        return kSuccess;
    }
    const std::string name = userName();
    return addChild(kUsersId, name, name, {}, open.id);
}

// The roots have no parent. In a damaged store where one has, walks of the tree would never end. Other cycles cannot be
// reached, because each key has one parent.
Status EmbeddedRegistry::checkBelow(KeyId id) {
    return id > kUsersId ? kSuccess : fail({kRegistryCorrupt, file_.path(), "the keys form a cycle"});
}

EmbeddedRegistry::KnownSubkey& EmbeddedRegistry::knownSlot(KeyId parent, std::string_view fold) {
    const std::size_t mixed = std::hash<std::string_view>{}(fold) + static_cast<std::size_t>(parent) * 31;
    return known_[mixed % known_.size()];
}

void EmbeddedRegistry::remember(KeyId parent, std::string_view fold, KeyId id) {
    KnownSubkey& slot = knownSlot(parent, fold);
    slot.fold = fold;  // first, because it may throw
    slot.transaction = transaction_;
    slot.parent = parent;
    slot.id = id;
}

Status EmbeddedRegistry::child(KeyId parent, std::string_view fold, KeyId& id) {
    const KnownSubkey& known = knownSlot(parent, fold);
    if (known.transaction == transaction_ && known.parent == parent && known.fold == fold) {
        id = known.id;
        return kSuccess;
    }
    if (std::any_of(missing_.begin(), missing_.end(), [&](const KnownSubkey& missing) {
            return missing.transaction == transaction_ && missing.parent == parent && missing.fold == fold;
        })) {
        return kFileNotFound;
    }
    for (const NewKey& key : newKeys_) {
        if (key.id == parent && std::find(key.subkeys.begin(), key.subkeys.end(), fold) == key.subkeys.end()) {
            return kFileNotFound;
        }
    }
    Query find = query(Sql::findKey);
    const int result = find.bind(parent).bind(fold).step();
    if (result == SQLITE_DONE) {
        missing_ = {KnownSubkey{transaction_, parent, 0, std::string(fold)}, std::move(missing_[0])};
        return kFileNotFound;
    }
    if (result != SQLITE_ROW) {
        return fail(result);
    }
    if (const Status status = checkBelow(find.number(0)); status != kSuccess) {
        return status;
    }
    id = find.number(0);
    remember(parent, fold, id);
    return kSuccess;
}

Status EmbeddedRegistry::addChild(KeyId parent, std::string_view name, std::string_view fold, std::string_view keyClass,
                                  KeyId& id) {
    const int result = query(Sql::addKey).bind(parent).bind(fold).bind(name).bind(keyClass).step();
    if (result != SQLITE_DONE) {
        return fail(result);
    }
    id = sqlite3_last_insert_rowid(connection_.get());
    firstNew_ = firstNew_ == 0 ? id : firstNew_;
    for (KnownSubkey& missing : missing_) {
        missing.transaction = missing.parent == parent && missing.fold == fold ? 0 : missing.transaction;
    }
    remember(parent, fold, id);
    subkeyAdded(parent, fold);
    // A new key has no values and no subkeys yet.
    placed_ = {Placed{id, 0}, placed_[0]};
    for (NewKey& key : newKeys_) {
        if (key.id == parent && key.subkeys.size() == kFewSubkeys) {
            key.id = 0;
        } else if (key.id == parent) {
            key.subkeys.emplace_back(fold);
        }
    }
    newKeys_[newKeys_[0].id == parent ? 1 : 0] = {id, {}};
    return kSuccess;
}

void EmbeddedRegistry::subkeyAdded(KeyId parent, std::string_view fold) {
    if (childless_ == parent) {
        childless_ = 0;
    }
    if (parent == kUsersId) {
        open_[kUserSlot].checkedIn = 0;  // it may exist now
    }
    for (OpenKey& open : open_) {
        if (!open.used || open.id != parent) {
            continue;
        }
        if (fold < open.keys.fold) {
            ++open.keys.index;
        } else {
            open.keys.ahead.clear();
        }
    }
}

void EmbeddedRegistry::subkeyDeleted(const Found& gone) {
    knownSlot(gone.parent, gone.fold).transaction = 0;
    for (KnownPath& known : knownPaths_) {
        known.transaction = known.id == gone.id ? 0 : known.transaction;
    }
    if (gone.parent == kUsersId) {
        open_[kUserSlot].checkedIn = 0;
    }
    for (OpenKey& open : open_) {
        open.deleted = open.deleted || open.id == gone.id;
        if (!open.used || open.id != gone.parent) {
            continue;
        }
        KeyPlace& place = open.keys;
        if (gone.fold < place.fold) {
            --place.index;
        } else if (place.next < place.ahead.size() && place.ahead[place.next].id == gone.id) {
            ++place.next;
        } else {
            place.ahead.clear();
        }
    }
}

const EmbeddedRegistry::KnownPath* EmbeddedRegistry::knownPath(KeyId parent, std::string_view path) const {
    const auto* const found = std::find_if(knownPaths_.begin(), knownPaths_.end(), [&](const KnownPath& known) {
        return known.transaction == transaction_ && known.parent == parent && known.path == path;
    });
    return found == knownPaths_.end() || path.empty() ? nullptr : &*found;
}

void EmbeddedRegistry::rememberPath(KeyId parent, std::string_view path, KeyId id) {
    knownPaths_[nextKnownPath_++ % knownPaths_.size()] = {transaction_, parent, id, std::string(path)};
}

// Follows the names of a path from the key that is found so far.
Status EmbeddedRegistry::descend(std::string_view rest, bool create, std::string_view keyClass, Found& found) {
    std::string_view name;
    while (takeName(rest, name)) {
        found.parent = found.id;
        found.fold = foldUpper(name);
        Status status = child(found.parent, found.fold, found.id);
        if (isNotFound(status) && create) {
            const bool last = rest.find_first_not_of('\\') == std::string_view::npos;
            status = addChild(found.parent, name, found.fold, last ? keyClass : std::string_view{}, found.id);
        }
        if (status != kSuccess) {
            return status;
        }
    }
    return kSuccess;
}

Status EmbeddedRegistry::find(KeyHandle parent, std::string_view path, AccessMask access, bool create,
                              std::string_view keyClass, Found& found) {
    if (const Status status = checkKeyPath(path); status != kSuccess) {
        return status;
    }
    OpenKey* base = nullptr;
    if (const Status status = keyOf(parent, 0, base); status != kSuccess) {
        return status;
    }
    if (const Status status = create ? makeUser(*base) : kSuccess; status != kSuccess) {
        return status;
    }
    found.id = base->id;
    const std::string plain = plainKeyPath(parent, path, access);
    std::string_view rest = plain;
    // A run opens many keys below the same one.
    const std::size_t end = plain.find_last_of('\\');
    const std::string_view above = std::string_view(plain).substr(0, end == std::string::npos ? 0 : end);
    const KnownPath* const known = knownPath(base->id, above);
    if (known != nullptr) {
        found.id = known->id;
        rest.remove_prefix(end);
    }
    if (const Status status = descend(rest, create, keyClass, found); status != kSuccess) {
        return status;
    }
    if (known == nullptr && !above.empty() && end + 1 != plain.size()) {
        rememberPath(base->id, above, found.parent);
    }
    return found.id == kNoKey ? kFileNotFound : kSuccess;
}

Status EmbeddedRegistry::openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) {
    OpenKey* base = nullptr;
    if (const Status status = keyOf(parent, 0, base); status != kSuccess) {
        return status;
    }
    const KeyId below = base->id;
    const KnownPath* const known = (access & kKeyView32) == 0 ? knownPath(below, path) : nullptr;
    if (known != nullptr) {
        key = giveOut(known->id, access);
        return kSuccess;
    }
    Found found;
    const Status status = find(parent, path, access, false, {}, found);
    if (status != kSuccess) {
        return status;
    }
    if ((access & kKeyView32) == 0) {
        rememberPath(below, path, found.id);
    }
    key = giveOut(found.id, access);
    return kSuccess;
}

Status EmbeddedRegistry::createKey(KeyHandle parent, std::string_view path, std::string_view keyClass,
                                   AccessMask access, KeyHandle& key) {
    Found found;
    const Status status = find(parent, path, access, true, keyClass, found);
    if (status == kSuccess) {
        key = giveOut(found.id, access);
    }
    return status;
}

Status EmbeddedRegistry::keyForValue(KeyHandle key, AccessMask needed, std::string_view name, OpenKey*& open) {
    const Status status = keyOf(key, needed, open);
    return status == kSuccess ? checkValueName(name) : status;
}

Status EmbeddedRegistry::queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) {
    OpenKey* open = nullptr;
    Status status = keyForValue(key, kKeyQueryValue, name, open);
    if (status != kSuccess) {
        return status;
    }
    const std::string fold = foldUpper(name);
    Query get = query(Sql::getValue);
    const int result = get.bind(open->id).bind(fold).step();
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? kFileNotFound : fail(result);
    }
    return giveQueried(static_cast<ValueType>(get.number(0)), get.bytes(1), type, data);
}

Status EmbeddedRegistry::nextPlace(KeyId key, std::int64_t& place) {
    if (placed_[0].key != key) {
        std::swap(placed_[0], placed_[1]);
    }
    if (placed_[0].key != key) {
        Query highest = query(Sql::highestPlace);
        if (const int result = highest.bind(key).step(); result != SQLITE_ROW) {
            return fail(result);
        }
        placed_[0] = {key, highest.number(0)};
    }
    // A value that exists keeps its place; the new number is not used.
    place = ++placed_[0].highest;
    return kSuccess;
}

Status EmbeddedRegistry::setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) {
    OpenKey* open = nullptr;
    Status status = keyForValue(key, kKeySetValue, name, open);
    if (status != kSuccess) {
        return status;
    }
    std::int64_t place = 0;
    if (status = makeUser(*open); status != kSuccess) {
        return status;
    }
    if (status = nextPlace(open->id, place); status != kSuccess) {
        return status;
    }
    const std::string fold = foldUpper(name);
    const int result = query(Sql::setValue)
                           .bind(open->id)
                           .bind(fold)
                           .bind(name)
                           .bind(static_cast<std::int64_t>(type))
                           .bindBytes(data)
                           .bind(place)
                           .step();
    for (OpenKey& other : open_) {
        if (other.used && other.id == open->id) {
            other.values.ahead.clear();
            if (place < other.values.place) {
                other.values = {};
            }
        }
    }
    return result == SQLITE_DONE ? kSuccess : fail(result);
}

Status EmbeddedRegistry::deleteValue(KeyHandle key, std::string_view name) {
    OpenKey* open = nullptr;
    Status status = keyForValue(key, kKeySetValue, name, open);
    if (status != kSuccess) {
        return status;
    }
    const std::string fold = foldUpper(name);
    const auto isEnumerated = [open](const OpenKey& other) {
        return other.used && other.id == open->id && other.values.place != 0;
    };
    if (std::none_of(open_.begin(), open_.end(), isEnumerated)) {
        const int result = query(Sql::deleteValue).bind(open->id).bind(fold).step();
        if (result != SQLITE_DONE) {
            return fail(result);
        }
        return sqlite3_changes(connection_.get()) != 0 ? kSuccess : kFileNotFound;
    }
    Query remove = query(Sql::deletePlacedValue);
    const int result = remove.bind(open->id).bind(fold).step();
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? kFileNotFound : fail(result);
    }
    valueDeleted(open->id, remove.number(0));
    return kSuccess;
}

void EmbeddedRegistry::valueDeleted(KeyId key, std::int64_t place) {
    for (OpenKey& open : open_) {
        if (!open.used || open.id != key || open.values.place == 0) {
            continue;
        }
        if (place < open.values.place) {
            --open.values.index;
        } else {
            open.values.ahead.clear();
        }
    }
}

Status EmbeddedRegistry::readAhead(const OpenKey& open, std::uint32_t skip, std::vector<Subkey>& rows) {
    Query next = query(Sql::nextKeys);
    int result = next.bind(open.id).bind(std::string_view(open.keys.fold)).bind(skip).step();
    for (; result == SQLITE_ROW; result = next.step()) {
        if (const Status status = checkBelow(next.number(0)); status != kSuccess) {
            return status;
        }
        // An index that disagrees with its table would never let the enumeration end.
        if (next.bytes(1) < open.keys.fold || (!rows.empty() && next.bytes(1) <= rows.back().fold)) {
            return fail(StoreFault{kRegistryCorrupt, path(), "an index disagrees with its table"});
        }
        rows.push_back(
            {next.number(0), std::string(next.bytes(1)), std::string(next.bytes(2)), std::string(next.bytes(3))});
    }
    return result == SQLITE_DONE ? kSuccess : fail(result);
}

Status EmbeddedRegistry::readAhead(const OpenKey& open, std::uint32_t skip, std::vector<ValueName>& rows) {
    Query next = query(Sql::nextValueNames);
    int result = next.bind(open.id).bind(open.values.place).bind(skip).step();
    for (; result == SQLITE_ROW; result = next.step()) {
        rows.push_back({next.number(0), std::string(next.bytes(1)), static_cast<ValueType>(next.number(2))});
    }
    return result == SQLITE_DONE ? kSuccess : fail(result);
}

// Makes the item that is `skip` behind the current one the next of those read ahead.
template <typename Place>
Status EmbeddedRegistry::advance(const OpenKey& open, Place& place, std::uint32_t skip) {
    if (place.next + skip < place.ahead.size()) {
        place.next += skip;
        return kSuccess;
    }
    if (place.isLast && !place.ahead.empty()) {
        return kNoMoreItems;
    }
    decltype(place.ahead) rows;
    if (const Status status = readAhead(open, skip, rows); status != kSuccess || rows.empty()) {
        return status != kSuccess ? status : kNoMoreItems;
    }
    place.isLast = rows.size() < kReadAhead;
    place.ahead = std::move(rows);
    place.next = 0;
    return kSuccess;
}

Status EmbeddedRegistry::enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) {
    OpenKey* open = nullptr;
    if (const Status status = keyOf(key, kKeyEnumerateSubkeys, open); status != kSuccess) {
        return status;
    }
    KeyPlace& place = open->keys;
    if (index < place.index) {
        place = {};
    }
    if (const Status status = advance(*open, place, index - place.index); status != kSuccess) {
        childless_ = status == kNoMoreItems && index == 0 ? open->id : childless_;
        return status;
    }
    const Subkey& found = place.ahead[place.next];
    place.index = index;
    place.fold = found.fold;
    remember(open->id, found.fold, found.id);
    const Status named = giveName(found.name, name);
    const Status classed = keyClass == nullptr ? kSuccess : giveName(found.keyClass, *keyClass);
    return named != kSuccess ? named : classed;
}

Status EmbeddedRegistry::enumerateValueName(OpenKey& open, std::uint32_t index, Buffer& name, ValueType* type) {
    ValuePlace& values = open.values;
    if (const Status status = advance(open, values, index - values.index); status != kSuccess) {
        return status;
    }
    const ValueName& found = values.ahead[values.next];
    values.index = index;
    values.place = found.place;
    const Status named = giveName(found.name, name);
    if (named == kSuccess && type != nullptr) {
        *type = found.type;
    }
    return named;
}

Status EmbeddedRegistry::enumerateWholeValue(OpenKey& open, std::uint32_t index, Buffer& name, ValueType* type,
                                             Buffer& data) {
    Query next = query(Sql::nextValue);
    const int result = next.bind(open.id).bind(open.values.place).bind(index - open.values.index).step();
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? kNoMoreItems : fail(result);
    }
    open.values = {index, next.number(0), {}, 0, false};
    const Status named = giveName(next.bytes(1), name);
    const auto found = static_cast<ValueType>(next.number(2));
    const Status given = giveData(found, next.bytes(3), data);
    if (named == kSuccess && given == kSuccess && type != nullptr) {
        *type = found;
    }
    return named != kSuccess ? named : given;
}

Status EmbeddedRegistry::enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type,
                                        Buffer* data) {
    OpenKey* open = nullptr;
    if (const Status status = keyOf(key, kKeyQueryValue, open); status != kSuccess) {
        return status;
    }
    if (index < open->values.index) {
        open->values = {};
    }
    return data == nullptr ? enumerateValueName(*open, index, name, type)
                           : enumerateWholeValue(*open, index, name, type, *data);
}

Status EmbeddedRegistry::deleteKey(KeyHandle parent, std::string_view path, AccessMask view) {
    Found found;
    if (const Status status = find(parent, path, view, false, {}, found); status != kSuccess) {
        return status;
    }
    if (found.id == kMachineId || found.id == kUsersId) {
        return kAccessDenied;
    }
    if (found.fold.empty()) {
        Query above = query(Sql::keyAbove);
        if (const int result = above.bind(found.id).step(); result != SQLITE_ROW) {
            return fail(result);
        }
        found.parent = above.number(0);
        found.fold = above.bytes(1);
    }
    if (childless_ != found.id) {
        if (const int result = query(Sql::hasSubkey).bind(found.id).step(); result != SQLITE_DONE) {
            return result == SQLITE_ROW ? kAccessDenied : fail(result);
        }
    }
    for (const Sql step : {Sql::deleteValues, Sql::deleteKey}) {
        if (const int result = query(step).bind(found.id).step(); result != SQLITE_DONE) {
            return fail(result);
        }
    }
    subkeyDeleted(found);
    return kSuccess;
}

}  // namespace kz7
