// Records what a run changes: decorators of the ports that a flow writes through.
#pragma once

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "install/platform/platform.h"
#include "install/src/registry/change_set.h"

namespace kz7 {

// Keeps every row that a run touches as it was before and as it is now. What others change meanwhile is not recorded.
class ChangeRecorder {
public:
    // States before are read from `registry`. Without `wholeServices`, a service is its
    // configuration only.
    ChangeRecorder(IRegistryStore& registry, bool wholeServices)
        : registry_(registry), wholeServices_(wholeServices), reader_(registry), open_(registry) {}

    // What differs, in the order of a difference.
    ChangeSet changes() const;

    // The first failure to read a state before; the record then has gaps.
    Status status() const { return status_; }
    void keep(Status status) { status_ = status_ == kSuccess ? status : status_; }

    // Before a key that does not exist is created, and after it was: with its missing parents.
    void beforeCreate(const KeyName& name);
    void created(const KeyName& name, std::string_view keyClass);

    void beforeDelete(const KeyName& name);
    void deleted(const KeyName& name);

    void beforeValue(const KeyName& key, std::string_view name);
    void valueSet(const KeyName& key, std::string_view name, std::optional<ValueState> state);

    // Around a change that another port makes to a key and what is below it.
    void beforeTree(const KeyName& name);
    void afterTree(const KeyName& name, bool isDeleted);

    // Closes what is kept open between calls.
    void rest() { open_.reset(); }

private:
    struct Value {
        std::string name;
        std::optional<ValueState> before;
        std::optional<ValueState> now;
    };
    struct Key {
        std::string name;
        std::string classBefore;
        std::string classNow;
        bool before = false;
        bool now = false;
        bool isListed = false;                // all values are touched
        std::map<std::string, Value> values;  // the touched ones, by folded name

        void noteValues(const std::vector<KeyValue>& existing);
        void remove();
    };

    struct Spelling {
        std::string name;  // full
        std::string keyClass;
    };

    void forgetTree(const KeyName& name);
    Spelling spell(const KeyName& name, bool exists);
    Key& note(const KeyName& name, bool exists);
    bool exists(const KeyName& name);
    void list(const KeyName& name, Key& key);
    IRegistryStore& registry_;
    bool wholeServices_;
    KeyReader reader_;
    OwnedKey open_;  // the key whose values were read last
    std::string openName_;
    Status status_ = kSuccess;
    std::map<std::string, Key> keys_;          // by their place in a walk
    std::map<std::string, Spelling> spelled_;  // by place
    std::vector<KeyName> missing_;             // before the creation that is being made
};

// The ports of a machine, those that change something behind a recorder.
class RecordedPorts {
public:
    // With `holdsCommits`, the run's commits succeed and do nothing: the caller commits.
    RecordedPorts(const Ports& real, bool wholeServices, bool holdsCommits = false);
    ~RecordedPorts();
    RecordedPorts(const RecordedPorts&) = delete;
    RecordedPorts& operator=(const RecordedPorts&) = delete;

    const Ports& ports() const { return ports_; }

    // What was changed up to the last commit that succeeded; with `holdsCommits`, up to now.
    ChangeSet changes() const;

    // As that of a recorder.
    Status status() const { return recorder_.status(); }

private:
    ChangeRecorder recorder_;
    Ports ports_;
    class Registry;
    class Services;
    class Assemblies;
    std::unique_ptr<Registry> registry_;
    std::unique_ptr<Services> services_;
    std::unique_ptr<Assemblies> assemblies_;
};

}  // namespace kz7
