#include "install/admin/fleet.h"

#include <algorithm>
#include <nlohmann/json.hpp>
#include <tuple>

#include "install/platform/text.h"

namespace kz7 {
namespace {

using nlohmann::json;

std::uint32_t escapedUnit(std::string_view text, std::size_t at) {
    const std::string digits(text.substr(at, 6));
    return digits.starts_with("\\u") && digits.size() == 6
               ? static_cast<std::uint32_t>(std::strtoul(digits.c_str() + 2, nullptr, 16))
               : 0;
}

// A byte that is no character is the escape of a lone surrogate in our documents. The parser refuses those, so each
// becomes the text of its escape.
std::string withoutLoneSurrogates(std::string_view text) {
    if (text.find("\\ud") == std::string_view::npos && text.find("\\uD") == std::string_view::npos) {
        return std::string(text);
    }
    std::string clean;
    for (std::size_t at = 0; at < text.size();) {
        const std::uint32_t unit = text[at] == '\\' ? escapedUnit(text, at) : 0;
        const std::uint32_t next = unit >> 10 == 0xD800 >> 10 ? escapedUnit(text, at + 6) : 0;
        std::size_t length = text[at] == '\\' ? 2 : 1;
        if (next >> 10 == 0xDC00 >> 10) {
            length = 12;
        } else if (unit >> 11 == 0xD800 >> 11) {
            clean += '\\';
            length = 6;
        }
        clean += text.substr(at, length);
        at += length;
    }
    return clean;
}

std::string textOf(const json& object, const char* field) {
    const auto found = object.is_object() ? object.find(field) : object.end();
    return found != object.end() && found->is_string() ? found->get<std::string>() : std::string{};
}

// Whether the field is a list of objects with these texts.
bool isListOf(const json& object, const char* field, std::initializer_list<const char*> texts) {
    const json list = object.value(field, json());
    return list.is_array() && std::all_of(list.begin(), list.end(), [&](const json& item) {
               return item.is_object() && std::all_of(texts.begin(), texts.end(), [&](const char* text) {
                          return item.value(text, json()).is_string();
                      });
           });
}

bool isYes(const json& object, const char* field) {
    return object.is_object() && object.value(field, json()) == true;
}

void addTrait(std::string label, std::string value, FleetMachine& machine) {
    std::string fold = foldUpper(label);
    machine.traits[std::move(fold)] = {std::move(label), std::move(value)};
}

void readCopies(const json& facts, FleetMachine& machine) {
    for (const json& copy : facts["copies"]) {
        if (textOf(copy, "view") != "native") {
            continue;
        }
        const std::string name = textOf(copy, "name");
        const std::string version = textOf(copy, "version");
        addTrait("copy " + name, version + " at " + textOf(copy, "location"), machine);
        std::string& copies = machine.versions[version];
        copies += (copies.empty() ? "" : ", ") + name;
        if (isYes(copy, "default")) {
            addTrait("default copy", name, machine);
        }
    }
    for (const json& program : facts["programs"]) {
        if (textOf(program, "name") == "kz7admin") {
            addTrait("kz7admin", textOf(program, "version"), machine);
        }
    }
}

void readFindings(const json& facts, std::size_t machine, Fleet& fleet) {
    for (const json& finding : facts["findings"]) {
        const std::string mark = textOf(finding, "mark");
        if (mark == "deliberate" || mark == "absent") {
            continue;
        }
        FleetFindings& same = fleet.findings[textOf(finding, "kind")];
        if (same.count++ == 0) {
            same.mark = mark;
            same.example =
                textOf(finding, "what") + ": " + textOf(finding, "why") + "; repair: " + textOf(finding, "repair");
        }
        if (same.machines.empty() || same.machines.back() != machine) {
            same.machines.push_back(machine);
        }
        fleet.machines[machine].isInOrder = fleet.machines[machine].isInOrder && mark != "fault";
    }
}

}  // namespace

FleetMachine& Fleet::add(std::string name, std::string_view facts) {
    FleetMachine& machine = machines.emplace_back();
    machine.name = std::move(name);
    const json document = json::parse(withoutLoneSurrogates(facts), nullptr, false);
    if (!document.is_object() || !isListOf(document, "copies", {"name", "view", "version", "location"}) ||
        !isListOf(document, "findings", {"kind", "mark", "what", "why", "repair"}) ||
        !isListOf(document, "programs", {"name", "version"})) {
        machine.fault = "not what kz7admin facts writes";
    } else if (document.value("schema", json()) != 1) {
        machine.fault = "a newer version of kz7admin wrote it";
    } else {
        readCopies(document, machine);
        readFindings(document, machines.size() - 1, *this);
    }
    return machine;
}

FleetValues Fleet::mostFrequent() const {
    const auto usable = static_cast<std::size_t>(std::count_if(
        machines.begin(), machines.end(), [](const FleetMachine& machine) { return machine.fault.empty(); }));
    FleetValues most;
    std::map<std::string, std::map<std::optional<std::string>, std::size_t>>
        counts;  // none: of those without the trait
    for (const FleetMachine& machine : machines) {
        for (const auto& [fold, trait] : machine.traits) {
            auto& values = counts[fold];
            const auto absent = values.try_emplace(std::nullopt, usable).first;
            --absent->second;
            ++values[trait.value];
            most.all.try_emplace(fold, FleetValue{trait.label, {}, 0, false});
        }
    }
    for (auto& [fold, found] : most.all) {
        const auto& values = counts[fold];
        std::tie(found.value, found.machines) =
            *std::max_element(values.begin(), values.end(),
                              [](const auto& left, const auto& right) { return left.second < right.second; });
        found.isMajority = 2 * found.machines > usable;
        if (found.isMajority && found.value) {
            most.expected.push_back(fold);
        }
    }
    return most;
}

std::vector<std::string> differencesOf(const FleetMachine& machine, const FleetValues& most) {
    std::vector<std::string> differences;
    for (const auto& [fold, trait] : machine.traits) {
        const FleetValue& other = most.all.at(fold);
        if (other.isMajority && other.value != trait.value) {
            differences.push_back(
                compose("%s is %s, most have %s", {trait.label, trait.value, other.value.value_or("none")}));
        }
    }
    for (const std::string& fold : most.expected) {
        if (!machine.traits.contains(fold)) {
            const FleetValue& other = most.all.at(fold);
            differences.push_back(compose("%s is missing, most have %s", {other.label, *other.value}));
        }
    }
    return differences;
}

}  // namespace kz7
