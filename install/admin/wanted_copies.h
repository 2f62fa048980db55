// The document that lists the copies a machine is to have; docs/ensure.schema.json describes it.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace kz7 {

struct WantedCopy {
    std::string name;
    std::string location;  // of a copy that is to be present
    bool isPresent = true;
};

// Reads the whole document. False at the first fault, with what is wrong and where: "copies[3].name: ...".
bool parseWantedCopies(std::string_view text, std::vector<WantedCopy>& copies, std::string& fault);

}  // namespace kz7
