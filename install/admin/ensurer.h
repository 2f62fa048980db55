// Compares copies with what is wanted, and adds and removes them by the flows of the tool.
#pragma once

#include <string>
#include <vector>

#include "install/admin/wanted_copies.h"
#include "install/platform/platform.h"
#include "install/src/copies/copy_list.h"
#include "install/src/registry/key_reader.h"
#include "install/src/registry/report.h"

namespace kz7 {

struct EnsureChoices {
    bool prune = false;     // removes the copies that are not listed
    bool all = false;       // with `prune`, the last copy too
    bool services = false;  // corrects services that belong to another location
};

class Ensurer {
public:
    // `servicesAreRows`: services are changed as rows of the registry.
    Ensurer(const Ports& ports, bool servicesAreRows, const EnsureChoices& choices)
        : ports_(ports), servicesAreRows_(servicesAreRows), choices_(choices), reader_(*ports.registry) {}

    // Empty, or why nothing may be removed. Changes nothing; called first.
    std::string plan(const std::vector<WantedCopy>& wanted);

    // Up to the first failure, without a commit of its own.
    Status make(const std::vector<WantedCopy>& wanted);

    std::vector<ErrorLine> errors;   // the error lines of the flows
    std::vector<std::string> notes;  // what stays otherwise than one may expect

private:
    // Returns the number of copies that are left.
    std::size_t findRemovals(InstallCopyList& list, const std::vector<WantedCopy>& wanted);
    std::string otherSpelling(KeyHandle copies, const std::vector<WantedCopy>& wanted);
    std::string unreadCopy(InstallCopyList& list);
    Status makePresent(const WantedCopy& copy);
    Status makeAbsent(const std::string& name);
    // Both locations must be as wanted, of the other rows only the existence counts. `kept` gets other versions.
    Status compare(const std::string& root, const WantedCopy& copy, bool& isInOrder, std::vector<std::string>& kept);
    Status hasService(const std::string& name, bool& exists);
    Status checkService(const std::string& name, const std::string& location);
    Status add(const WantedCopy& copy);

    const Ports& ports_;
    bool servicesAreRows_;
    EnsureChoices choices_;
    KeyReader reader_;
    Status listed_ = kSuccess;
    std::vector<Subkey> subkeys_;  // of the key of the copies
    std::vector<std::string> removals_;
    std::size_t left_ = 0;  // copies after the removals
};

}  // namespace kz7
