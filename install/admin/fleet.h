// The facts of many machines: what each machine has, what most of them have, and where one differs.
#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace kz7 {

// What a machine has, and what machines are compared by: a copy with its version and location, the default copy, the
// version of this program.
struct FleetTrait {
    std::string label;
    std::string value;
};

struct FleetMachine {
    std::string name;
    std::string fault;                            // why its facts cannot be used; empty: they can
    std::map<std::string, FleetTrait> traits;     // by upper-cased label
    std::map<std::string, std::string> versions;  // with the names of their copies
    bool isInOrder = true;                        // no finding is a fault
};

struct FleetFindings {
    std::string mark;
    std::string example;                // the text of the first one
    std::size_t count = 0;              // of findings
    std::vector<std::size_t> machines;  // that have them, as places in Fleet::machines
};

// The most frequent value of a trait.
struct FleetValue {
    std::string label;
    std::optional<std::string> value;  // none: most machines do not have the trait
    std::size_t machines = 0;
    bool isMajority = false;  // more than half of the machines
};

struct FleetValues {
    std::map<std::string, FleetValue> all;  // by upper-cased label
    std::vector<std::string> expected;      // the keys of those that more than half of the machines have
};

struct Fleet {
    std::vector<FleetMachine> machines;
    std::map<std::string, FleetFindings> findings;  // by kind, without those that are deliberate or absent

    // Adds a machine from what `kz7admin facts` wrote there.
    FleetMachine& add(std::string name, std::string_view facts);

    FleetValues mostFrequent() const;
};

// In words, one for each trait in which the machine differs from the majority.
std::vector<std::string> differencesOf(const FleetMachine& machine, const FleetValues& most);

}  // namespace kz7
