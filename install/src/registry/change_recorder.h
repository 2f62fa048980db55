// Records what a run changes: decorators of the ports that a flow writes through.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

#include "install/platform/platform.h"
#include "install/platform/service_records.h"
#include "install/src/registry/touched_rows.h"

namespace kz7 {

struct RecordOptions {
    // The machine keeps its services as records in this registry alone; else a service is its configuration only.
    bool wholeServices = false;
    bool holdsCommits = false;  // the commits of the run succeed and do nothing: the caller commits
    bool everyKey = false;      // the history gets all keys, not only those of the product
};

// Keeps every row that a run touches as it was before and as it is now. What others change meanwhile is not recorded.
class ChangeRecorder {
public:
    // States before are read from `registry`. With a history that takes each change, it gets them before they are made.
    ChangeRecorder(IRegistryStore& registry, const RecordOptions& options, IHistory* history)
        : registry_(registry),
          wholeServices_(options.wholeServices),
          onlyProduct_(history != nullptr && !options.everyKey),
          journal_(history != nullptr && history->takesEachChange() ? history : nullptr),
          reader_(registry),
          open_(registry) {}

    TouchedRows& rows() { return rows_; }
    const TouchedRows& rows() const { return rows_; }

    // The first failure to read a state before; the record then has gaps.
    Status status() const { return status_; }
    void keep(Status status) { status_ = status_ == kSuccess ? status : status_; }

    // A key as its handle knows it.
    struct Place {
        KeyName name;
        TouchedRows::Key* key = nullptr;  // once it is touched
    };

    // Each makes a change by `call` and records it.
    template <typename Call>
    Status createKey(Place& place, std::string_view keyClass, Call call);
    template <typename Open, typename Call>
    Status deleteKey(const KeyName& name, Open open, Call call);
    template <typename Call>
    Status changeValue(Place& place, std::string_view value, std::optional<ValueState> now, Call call);

    // The same for a change that another port makes to a key and what is below it. `expected` are values that the key
    // will have.
    template <typename Call>
    Status changeTree(const KeyName& name, bool isDeletion, const std::vector<ServiceValue>& expected, Call call);

    // Closes what is kept open between calls.
    void rest() { open_.reset(); }

private:
    using Key = TouchedRows::Key;
    using Row = TouchedRows::Row;
    struct Spelling {
        std::string name;  // full
        std::string keyClass;
    };

    bool isRecorded(const KeyName& name) const { return !onlyProduct_ || isProductKey(name); }
    void spellBelow(KeyHandle key, const std::string& fullName);
    const Spelling& spell(const KeyName& name, bool exists);
    Key& note(const KeyName& name, bool exists);
    Key& named(const KeyName& name, Key& key);
    Key& named(const KeyName& name, bool exists) { return named(name, note(name, exists)); }
    Status open(const KeyName& name, const Key& key);
    bool exists(KeyHandle root, std::string_view path, std::string_view fullName);
    void list(const KeyName& name, Key& key);
    Row* beforeValue(const KeyName& name, Key& key, std::string_view value, const std::optional<ValueState>& now);
    std::vector<KeyName> missingKeys(const KeyName& name);
    void beforeTree(const KeyName& name);
    void expectTree(const KeyName& name, bool isDeletion, const std::vector<ServiceValue>& expected);
    void afterTree(const KeyName& name, bool isDeleted);
    void write(const std::vector<const Key*>& keys, TouchedForm form);
    void write(const Key& key, const Row& row);

    IRegistryStore& registry_;
    bool wholeServices_;
    bool onlyProduct_;
    IHistory* journal_;
    KeyReader reader_;
    OwnedKey open_;  // the key whose values were read last
    const Key* opened_ = nullptr;
    Status status_ = kSuccess;
    TouchedRows rows_;
    std::unordered_map<std::string, Spelling> spelled_;  // by place
    std::vector<KeyName> missing_;                       // above and with a tree that is being changed
};

// The ports of a machine, those that change something behind a recorder. What is changed goes to the history, if the
// machine has one that is on.
class RecordedPorts {
public:
    RecordedPorts(const Ports& real, const RecordOptions& options);
    ~RecordedPorts();
    RecordedPorts(const RecordedPorts&) = delete;
    RecordedPorts& operator=(const RecordedPorts&) = delete;

    const Ports& ports() const { return ports_; }

    // Commits what was done, where the run's own commits do nothing.
    Status commit();

    // What was changed up to the last commit that succeeded; with `holdsCommits`, up to now. Counting takes far less
    // than listing.
    ChangeSet changes() const;
    ChangeCounts counts() const;

    // As that of a recorder.
    Status status() const { return recorder_.status(); }

private:
    IHistory* history_;  // null: nothing is kept
    ChangeRecorder recorder_;
    Ports ports_;
    class Registry;
    class Services;
    class Assemblies;
    class Programs;
    std::unique_ptr<Registry> registry_;
    std::unique_ptr<IServiceManager> services_;
    std::unique_ptr<Assemblies> assemblies_;
    std::unique_ptr<Programs> programs_;
};

}  // namespace kz7
