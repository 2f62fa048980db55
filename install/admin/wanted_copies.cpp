#include "install/admin/wanted_copies.h"

#include <algorithm>
#include <nlohmann/json.hpp>
#include <set>

#include "install/platform/text.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

using nlohmann::json;

constexpr std::size_t kLongestName = 64;       // characters; longer names make copies that cannot be told apart
constexpr std::size_t kLongestLocation = 255;  // characters of a copy's record

bool hasControls(const std::string& text) {
    return std::any_of(text.begin(), text.end(),
                       [](char c) { return static_cast<unsigned char>(c) < ' ' || c == '\x7F'; });
}

// What makes a name one that no copy can work with; empty for a good one.
std::string_view faultOfName(const std::string& name) {
    if (name.empty()) {
        return "is empty";
    }
    if (!fitsCharacters(name, kLongestName)) {
        return "is longer than 64 characters";
    }
    if (!isOneName(name) || hasControls(name)) {
        return "is not a valid copy name";
    }
    return equalsIgnoreCase(name, layout::kVersion8Copy) ? "stands for a version-8 installation" : "";
}

std::string_view faultOfLocation(const std::string& location) {
    if (location.empty()) {
        return "is empty";
    }
    if (!fitsCharacters(location, kLongestLocation)) {
        return "is longer than 255 characters";
    }
    return hasControls(location) ? "holds a control character" : "";
}

class Reader {
public:
    Reader(std::vector<WantedCopy>& copies, std::string& fault) : copies_(copies), fault_(fault) {}

    bool document(const json& document) {
        if (!document.is_object()) {
            return fail("document", "is not an object");
        }
        if (!fields(document, "", {"copies", "schema", "$schema"})) {
            return false;
        }
        if (document.value("schema", json(1)) != 1) {
            return fail("schema", "is not 1");
        }
        if (const auto link = document.find("$schema"); link != document.end() && !link->is_string()) {
            return fail("$schema", "is not a string");
        }
        const auto list = document.find("copies");
        if (list == document.end() || !list->is_array()) {
            return fail("copies", list == document.end() ? "is missing" : "is not an array");
        }
        bool isGood = true;
        for (std::size_t index = 0; isGood && index < list->size(); ++index) {
            isGood = copy((*list)[index], compose("copies[%u]", {static_cast<std::uint32_t>(index)}));
        }
        return isGood;
    }

private:
    bool fail(std::string_view path, std::string_view reason) {
        fault_ = compose("%s: %s", {path, reason});
        return false;
    }

    bool text(const json& copy, const std::string& path, const char* field, std::string& text) {
        const auto found = copy.find(field);
        if (found != copy.end() && !found->is_string()) {
            return fail(compose("%s.%s", {path, std::string_view(field)}), "is not a string");
        }
        text = found == copy.end() ? std::string{} : found->get<std::string>();
        return true;
    }

    bool fields(const json& object, const std::string& path, std::initializer_list<std::string_view> known) {
        for (const auto& [field, value] : object.items()) {
            if (std::find(known.begin(), known.end(), field) == known.end()) {
                return fail(path + field, "is an unknown field");
            }
        }
        return true;
    }

    bool copy(const json& copy, const std::string& path) {
        WantedCopy wanted;
        std::string state;
        if (!copy.is_object()) {
            return fail(path, "is not an object");
        }
        if (!fields(copy, path + '.', {"name", "location", "state"}) || !text(copy, path, "name", wanted.name) ||
            !text(copy, path, "location", wanted.location) || !text(copy, path, "state", state)) {
            return false;
        }
        wanted.isPresent = state != "absent";
        if (!check(copy, path, wanted, state)) {
            return false;
        }
        copies_.push_back(std::move(wanted));
        return true;
    }

    bool check(const json& copy, const std::string& path, const WantedCopy& wanted, const std::string& state) {
        std::string_view fault = copy.contains("name") ? faultOfName(wanted.name) : "is missing";
        if (fault.empty() && !names_.insert(foldUpper(wanted.name)).second) {
            fault = "is in the list twice";
        }
        if (!fault.empty()) {
            return fail(path + ".name", fault);
        }
        if (copy.contains("state") && state != "present" && state != "absent") {
            return fail(path + ".state", "is neither \"present\" nor \"absent\"");
        }
        if (wanted.isPresent) {
            fault = copy.contains("location") ? faultOfLocation(wanted.location) : "is missing";
        }
        return fault.empty() || fail(path + ".location", fault);
    }

    std::vector<WantedCopy>& copies_;
    std::string& fault_;
    std::set<std::string> names_;  // folded
};

}  // namespace

bool parseWantedCopies(std::string_view text, std::vector<WantedCopy>& copies, std::string& fault) {
    json document;
    std::vector<std::set<std::string>> open;  // the names of the fields of each open object
    std::string twice;
    const auto watch = [&](int, json::parse_event_t event, json& parsed) {
        if (event == json::parse_event_t::object_start) {
            open.emplace_back();
        } else if (event == json::parse_event_t::object_end) {
            open.pop_back();
        } else if (event == json::parse_event_t::key && !open.back().insert(parsed.get<std::string>()).second) {
            twice = parsed.get<std::string>();
        }
        return true;
    };
    try {
        document = json::parse(text, watch);
    } catch (const json::parse_error& error) {
        const std::size_t read = std::min(error.byte, text.size());
        const auto line = 1 + std::count(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(read), '\n');
        fault = compose("line %u: not valid JSON", {static_cast<std::uint32_t>(line)});
        return false;
    } catch (const json::out_of_range&) {
        fault = "a number is out of range";
        return false;
    }
    if (!twice.empty()) {
        fault = twice + ": is twice in one object";
        return false;
    }
    return Reader(copies, fault).document(document);
}

}  // namespace kz7
