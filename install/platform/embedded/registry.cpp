#include "install/platform/embedded/registry.h"

#include <unistd.h>

#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::int64_t kMachineId = 1;
constexpr std::int64_t kUsersId = 2;
constexpr std::uint32_t kRoots = 3;  // the first slots of the open keys
constexpr std::int64_t kPageSize = 4096;
constexpr std::int64_t kLogLimit = 256 * 1024;  // bytes of log that a run leaves to the next one

// clang-format off
constexpr std::array kSql = {
    "SELECT id FROM key WHERE parent = ? AND fold = ?",
    "INSERT INTO key (parent, fold, name, class) VALUES (?, ?, ?, ?)",
    "SELECT 1 FROM key WHERE id = ?",
    "SELECT fold, name, class FROM key WHERE parent = ? AND fold >= ? ORDER BY fold LIMIT 1 OFFSET ?",
    "SELECT 1 FROM key WHERE parent = ? LIMIT 1",
    "DELETE FROM key WHERE id = ? RETURNING parent, fold",
    "DELETE FROM value WHERE key = ?",
    "SELECT type, data FROM value WHERE key = ? AND fold = ?",
    "INSERT INTO value (key, fold, name, type, data, place) VALUES (?1, ?2, ?3, ?4, ?5,"
        " (SELECT coalesce(max(place), 0) + 1 FROM value WHERE key = ?1))"
        " ON CONFLICT (key, fold) DO UPDATE SET type = excluded.type, data = excluded.data",
    "DELETE FROM value WHERE key = ? AND fold = ? RETURNING place",
    "SELECT place, name, type, data FROM value WHERE key = ? AND place >= ? ORDER BY place LIMIT 1 OFFSET ?",
};
// clang-format on

}  // namespace

enum class EmbeddedRegistry::Sql : std::size_t {
    findKey,
    addKey,
    keyExists,
    nextKey,
    hasSubkey,
    deleteKey,
    deleteValues,
    getValue,
    setValue,
    deleteValue,
    nextValue,
};

EmbeddedRegistry::EmbeddedRegistry(const std::string& directory, bool readOnly, FaultListener listener)
    : file_(directory), readOnly_(readOnly), listener_(std::move(listener)) {
    static_assert(kSql.size() == std::tuple_size_v<decltype(statements_)>);
    for (const KeyId id : {kMachineId, kUsersId, KeyId{0}}) {
        OpenKey& root = open_.emplace_back();
        root.used = true;
        root.access = kKeyFull;
        root.id = id;
    }
}

EmbeddedRegistry::~EmbeddedRegistry() {
    endTransaction();
    if (logPages_ * kPageSize > kLogLimit) {
        // Whoever is in the way makes the checkpoint at their own end; nobody waits for this one.
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
    return fail(file_.explain(connection_.get(), result));
}

Status EmbeddedRegistry::begin() {
    if (fault_ != kSuccess || inTransaction_) {
        return fault_;
    }
    if (connection_ == nullptr) {
        const StoreFault fault = !readOnly_       ? file_.openForWriting(connection_)
                                 : file_.exists() ? file_.open(connection_)
                                                  : file_.openEmpty(connection_);
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
    inTransaction_ = true;
    ++transaction_;
    lastPath_.clear();
    return kSuccess;
}

void EmbeddedRegistry::endTransaction() {
    if (connection_ != nullptr && sqlite3_get_autocommit(connection_.get()) == 0) {
        execute(connection_.get(), "ROLLBACK");
    }
    inTransaction_ = false;
    lastPath_.clear();
}

Status EmbeddedRegistry::commit() {
    if (fault_ == kSuccess && inTransaction_) {
        if (const int result = execute(connection_.get(), "COMMIT"); result != SQLITE_OK) {
            fail(result);
        }
    }
    endTransaction();
    return std::exchange(fault_, kSuccess);
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
            return &open_[0];
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
        free_.push_back(static_cast<std::uint32_t>(open_.size() - 1));
    }
    const std::uint32_t slot = free_.back();
    free_.pop_back();
    const std::uint32_t generation = open_[slot].generation + 1;
    open_[slot] = OpenKey{};
    open_[slot].used = true;
    open_[slot].generation = generation;
    open_[slot].access = access;
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
        // Another process may have written since.
        found->keys = {};
        found->values = {};
        if (handle == KeyHandle::currentUser) {
            if (const Status status = currentUser(found->id); status != kSuccess) {
                return status;
            }
        } else if (!found->deleted) {
            const int result = query(Sql::keyExists).bind(found->id).step();
            if (result != SQLITE_ROW && result != SQLITE_DONE) {
                return fail(result);
            }
            found->deleted = result == SQLITE_DONE;
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

Status EmbeddedRegistry::currentUser(KeyId& id) {
    const std::string sid = "S-1-22-1-" + std::to_string(geteuid());
    const Status status = child(kUsersId, sid, id);
    return isNotFound(status) && !readOnly_ ? addChild(kUsersId, sid, sid, {}, id) : status;
}

Status EmbeddedRegistry::child(KeyId parent, std::string_view fold, KeyId& id) {
    Query find = query(Sql::findKey);
    const int result = find.bind(parent).bind(fold).step();
    if (result == SQLITE_ROW) {
        id = find.number(0);
        return kSuccess;
    }
    return result == SQLITE_DONE ? kFileNotFound : fail(result);
}

Status EmbeddedRegistry::addChild(KeyId parent, std::string_view name, std::string_view fold, std::string_view keyClass,
                                  KeyId& id) {
    const int result = query(Sql::addKey).bind(parent).bind(fold).bind(name).bind(keyClass).step();
    if (result != SQLITE_DONE) {
        return fail(result);
    }
    id = sqlite3_last_insert_rowid(connection_.get());
    for (OpenKey& open : open_) {
        if (open.used && open.id == parent && fold < open.keys.fold) {
            ++open.keys.index;
        }
    }
    return kSuccess;
}

Status EmbeddedRegistry::find(KeyHandle parent, std::string_view path, AccessMask access, bool create,
                              std::string_view keyClass, KeyId& id) {
    if (const Status status = checkKeyPath(path); status != kSuccess) {
        return status;
    }
    OpenKey* base = nullptr;
    if (const Status status = keyOf(parent, 0, base); status != kSuccess) {
        return status;
    }
    if (lastRoot_ != base->id) {
        lastRoot_ = base->id;
        lastPath_.clear();
    }
    const std::string plain = plainKeyPath(parent, path, access);
    std::string_view rest = plain;
    std::string_view name;
    KeyId at = base->id;
    for (std::size_t depth = 0; takeName(rest, name); ++depth) {
        std::string fold = foldUpper(name);
        if (depth < lastPath_.size() && lastPath_[depth].fold == fold) {
            at = lastPath_[depth].id;
            continue;
        }
        lastPath_.resize(depth);
        KeyId below = 0;
        Status status = child(at, fold, below);
        if (isNotFound(status) && create) {
            const bool last = rest.find_first_not_of('\\') == std::string_view::npos;
            status = addChild(at, name, fold, last ? keyClass : std::string_view{}, below);
        }
        if (status != kSuccess) {
            return status;
        }
        lastPath_.push_back({std::move(fold), below});
        at = below;
    }
    id = at;
    return kSuccess;
}

Status EmbeddedRegistry::openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) {
    KeyId id = 0;
    const Status status = find(parent, path, access, false, {}, id);
    if (status == kSuccess) {
        key = giveOut(id, access);
    }
    return status;
}

Status EmbeddedRegistry::createKey(KeyHandle parent, std::string_view path, std::string_view keyClass,
                                   AccessMask access, KeyHandle& key) {
    KeyId id = 0;
    const Status status = find(parent, path, access, true, keyClass, id);
    if (status == kSuccess) {
        key = giveOut(id, access);
    }
    return status;
}

Status EmbeddedRegistry::queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) {
    OpenKey* open = nullptr;
    Status status = keyOf(key, kKeyQueryValue, open);
    if (status == kSuccess) {
        status = checkValueName(name);
    }
    if (status != kSuccess) {
        return status;
    }
    const std::string fold = foldUpper(name);
    Query get = query(Sql::getValue);
    const int result = get.bind(open->id).bind(fold).step();
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? kFileNotFound : fail(result);
    }
    status = giveBytes(get.bytes(1), data);
    if (status == kSuccess && type != nullptr) {
        *type = static_cast<ValueType>(get.number(0));
    }
    return status;
}

Status EmbeddedRegistry::setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) {
    OpenKey* open = nullptr;
    Status status = keyOf(key, kKeySetValue, open);
    if (status == kSuccess) {
        status = checkValueName(name);
    }
    if (status != kSuccess) {
        return status;
    }
    const std::string fold = foldUpper(name);
    const int result = query(Sql::setValue)
                           .bind(open->id)
                           .bind(fold)
                           .bind(name)
                           .bind(static_cast<std::int64_t>(type))
                           .bindBytes(data)
                           .step();
    return result == SQLITE_DONE ? kSuccess : fail(result);
}

Status EmbeddedRegistry::deleteValue(KeyHandle key, std::string_view name) {
    OpenKey* open = nullptr;
    Status status = keyOf(key, kKeySetValue, open);
    if (status == kSuccess) {
        status = checkValueName(name);
    }
    if (status != kSuccess) {
        return status;
    }
    const std::string fold = foldUpper(name);
    Query remove = query(Sql::deleteValue);
    const int result = remove.bind(open->id).bind(fold).step();
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? kFileNotFound : fail(result);
    }
    const std::int64_t place = remove.number(0);
    for (OpenKey& other : open_) {
        if (other.used && other.id == open->id && place < other.values.place) {
            --other.values.index;
        }
    }
    return kSuccess;
}

Status EmbeddedRegistry::enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) {
    OpenKey* open = nullptr;
    if (const Status status = keyOf(key, kKeyEnumerateSubkeys, open); status != kSuccess) {
        return status;
    }
    if (index < open->keys.index) {
        open->keys = {};
    }
    Query next = query(Sql::nextKey);
    const int result =
        next.bind(open->id).bind(std::string_view(open->keys.fold)).bind(index - open->keys.index).step();
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? kNoMoreItems : fail(result);
    }
    const Status named = giveName(next.bytes(1), name);
    const Status classed = keyClass == nullptr ? kSuccess : giveName(next.bytes(2), *keyClass);
    const std::string fold(next.bytes(0));
    open->keys = {index, fold};
    return named != kSuccess ? named : classed;
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
    Query next = query(Sql::nextValue);
    const int result = next.bind(open->id).bind(open->values.place).bind(index - open->values.index).step();
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? kNoMoreItems : fail(result);
    }
    open->values = {index, next.number(0)};
    const Status named = giveName(next.bytes(1), name);
    const Status given = data == nullptr ? kSuccess : giveBytes(next.bytes(3), *data);
    if (named == kSuccess && given == kSuccess && type != nullptr) {
        *type = static_cast<ValueType>(next.number(2));
    }
    return named != kSuccess ? named : given;
}

Status EmbeddedRegistry::deleteKey(KeyHandle parent, std::string_view path, AccessMask view) {
    KeyId id = 0;
    if (const Status status = find(parent, path, view, false, {}, id); status != kSuccess) {
        return status;
    }
    if (id == kMachineId || id == kUsersId) {
        return kAccessDenied;
    }
    int result = query(Sql::hasSubkey).bind(id).step();
    if (result != SQLITE_DONE) {
        return result == SQLITE_ROW ? kAccessDenied : fail(result);
    }
    result = query(Sql::deleteValues).bind(id).step();
    if (result != SQLITE_DONE) {
        return fail(result);
    }
    Query remove = query(Sql::deleteKey);
    result = remove.bind(id).step();
    if (result != SQLITE_ROW) {
        return fail(result);
    }
    const KeyId above = remove.number(0);
    const std::string_view fold = remove.bytes(1);
    for (OpenKey& open : open_) {
        if (open.used && open.id == above && fold < open.keys.fold) {
            --open.keys.index;
        }
        open.deleted = open.deleted || open.id == id;
    }
    for (std::size_t depth = 0; depth < lastPath_.size(); ++depth) {
        if (lastPath_[depth].id == id) {
            lastPath_.resize(depth);
        }
    }
    return kSuccess;
}

}  // namespace kz7
