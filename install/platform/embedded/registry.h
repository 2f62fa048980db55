// The registry port on an embedded SQLite store. All changes between two commit points are one transaction, begun as a
// writer before the first read: the flows decide on deletions by what they read.
#pragma once

#include <array>
#include <functional>
#include <string>
#include <vector>

#include "install/platform/embedded/database.h"
#include "install/platform/embedded/store_file.h"
#include "install/platform/registry_store.h"

namespace kz7 {

class EmbeddedRegistry final : public IRegistryStore {
public:
    // Called once for each fault of the store, before the operation that met it returns.
    using FaultListener = std::function<void(const StoreFault&)>;

    // Does not open the store yet. A read-only store takes no writer's lock and creates nothing; a missing one reads as
    // empty.
    EmbeddedRegistry(const std::string& directory, bool readOnly, FaultListener listener,
                     const StoreReading& reading = {});
    EmbeddedRegistry(const EmbeddedRegistry&) = delete;
    EmbeddedRegistry& operator=(const EmbeddedRegistry&) = delete;

    // Changes that are not committed are dropped.
    ~EmbeddedRegistry() override;

    const std::string& path() const { return file_.path(); }
    bool exists() const { return file_.exists(); }
    bool isFile(const std::string& path) const { return file_.isPart(path); }

    // The content of a file with the whole store, in this transaction. kFileNotFound: no store exists.
    Status image(std::string& bytes);

    // Puts the content of another store in the place of this one; see StoreFile::replace(). Keys must not be open.
    Status replaceBy(EmbeddedRegistry& content, std::string& kept);

    // The damages that SQLite finds in the store, at most ten.
    Status examine(std::vector<std::string>& damages);

    // Reads or writes other tables of the store in this transaction. `work` returns SQLITE_OK or an error.
    using Work = std::function<int(sqlite3*)>;
    Status use(const Work& work);

    // Does the same in a transaction of its own, without a word about a fault. Changes that are not committed are
    // dropped.
    void useQuietly(const Work& work);

    Status openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) override;
    Status createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                     KeyHandle& key) override;
    Status closeKey(KeyHandle key) override;
    Status queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) override;
    Status setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) override;
    Status deleteValue(KeyHandle key, std::string_view name) override;
    Status enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) override;
    Status enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) override;
    Status deleteKey(KeyHandle parent, std::string_view path, AccessMask view) override;
    Status commit() override;

private:
    enum class Sql : std::size_t;
    using KeyId = std::int64_t;

    struct Subkey {
        KeyId id = 0;
        std::string fold;
        std::string name;
        std::string keyClass;
    };
    // The position of an enumeration: `index` items precede it. Stored as a name or number, never as an open cursor.
    struct KeyPlace {
        std::uint32_t index = 0;
        std::string fold;           // empty: before the first
        std::vector<Subkey> ahead;  // read ahead; the item at `next` is the next one
        std::size_t next = 0;
        bool isLast = false;  // no item follows those read ahead
    };
    struct ValueName {
        std::int64_t place = 0;
        std::string name;
        ValueType type = ValueType::none;
    };
    struct ValuePlace {
        std::uint32_t index = 0;
        std::int64_t place = 0;
        std::vector<ValueName> ahead;  // read ahead if no data are requested; the item at `next` is the current one
        std::size_t next = 0;
        bool isLast = false;
    };
    struct OpenKey {
        bool used = false;
        bool deleted = false;
        std::uint32_t generation = 0;  // how often the slot was used
        AccessMask access = 0;
        KeyId id = 0;
        std::uint64_t checkedIn = 0;  // the transaction that last looked the key up
        KeyPlace keys;
        ValuePlace values;
    };
    // A subkey that was looked up, created or enumerated in this transaction.
    struct KnownSubkey {
        std::uint64_t transaction = 0;
        KeyId parent = 0;
        KeyId id = 0;
        std::string fold;
    };
    // A path that was opened in this transaction; flows open the copies of both views in turn.
    struct KnownPath {
        std::uint64_t transaction = 0;
        KeyId parent = 0;
        KeyId id = 0;
        std::string path;
    };
    // A key that got a new value, and the highest place in it.
    struct Placed {
        KeyId key = 0;
        std::int64_t highest = 0;
    };
    // A key that this transaction created, with all subkeys that it got, while they are few.
    struct NewKey {
        KeyId id = 0;
        std::vector<std::string> subkeys;  // folded
    };
    // The result of resolving a path.
    struct Found {
        KeyId id = 0;
        KeyId parent = 0;
        std::string fold;  // empty: the path was empty
    };

    Status begin();
    Status fail(int result);
    Status fail(const StoreFault& fault);
    void endTransaction();
    bool overwriteFailedCommit();
    Query query(Sql which);

    OpenKey* slotOf(KeyHandle handle);
    KeyHandle giveOut(KeyId id, AccessMask access);
    // The key of a handle that has the required rights. The pointer is valid until the next key is opened.
    Status keyOf(KeyHandle handle, AccessMask needed, OpenKey*& open);
    Status keyForValue(KeyHandle key, AccessMask needed, std::string_view name, OpenKey*& open);
    Status lookUp(OpenKey& open);
    Status makeUser(OpenKey& open);
    Status child(KeyId parent, std::string_view fold, KeyId& id);
    Status nextPlace(KeyId key, std::int64_t& place);
    Status addChild(KeyId parent, std::string_view name, std::string_view fold, std::string_view keyClass, KeyId& id);
    Status descend(std::string_view rest, bool create, std::string_view keyClass, Found& found);
    Status find(KeyHandle parent, std::string_view path, AccessMask access, bool create, std::string_view keyClass,
                Found& found);
    const KnownPath* knownPath(KeyId parent, std::string_view path) const;
    void rememberPath(KeyId parent, std::string_view path, KeyId id);
    KnownSubkey& knownSlot(KeyId parent, std::string_view fold);
    void remember(KeyId parent, std::string_view fold, KeyId id);
    Status readAhead(const OpenKey& open, std::uint32_t skip, std::vector<Subkey>& rows);
    Status readAhead(const OpenKey& open, std::uint32_t skip, std::vector<ValueName>& rows);
    template <typename Place>
    Status advance(const OpenKey& open, Place& place, std::uint32_t skip);
    // Only names and types are read ahead: data would be copied for callers that stop early.
    Status enumerateValueName(OpenKey& open, std::uint32_t index, Buffer& name, ValueType* type);
    Status enumerateWholeValue(OpenKey& open, std::uint32_t index, Buffer& name, ValueType* type, Buffer& data);
    // Corrects the enumerations of that key.
    void valueDeleted(KeyId key, std::int64_t place);
    Status checkBelow(KeyId id);
    void subkeyAdded(KeyId parent, std::string_view fold);
    void subkeyDeleted(const Found& gone);

    StoreFile file_;
    bool readOnly_;
    FaultListener listener_;
    // Declared before the statements, which must be destroyed before the connection closes.
    Connection connection_;
    std::array<Statement, 15> statements_;
    Status fault_ = kSuccess;  // of this transaction; every operation returns it until the next commit point
    bool inTransaction_ = false;
    bool commitFailed_ = false;  // the next process may still find it in the log
    std::uint64_t transaction_ = 0;
    KeyId firstNew_ = 0;  // the first key that this transaction created; ids ascend
    std::int64_t logPages_ = 0;
    std::vector<OpenKey> open_;  // the roots first
    std::vector<std::uint32_t> free_;
    std::array<KnownSubkey, 256> known_;
    std::array<KnownSubkey, 2> missing_;  // looked up in vain, in either view of a copy; usually created next
    KeyId childless_ = 0;                 // the key that was last seen to have no subkey
    std::array<KnownPath, 8> knownPaths_;
    std::size_t nextKnownPath_ = 0;
    std::array<Placed, 2> placed_;  // the last one first
    std::array<NewKey, 2> newKeys_;
};

}  // namespace kz7
