#include "install/runtime/message_catalogue.h"

#include <algorithm>
#include <array>
#include <charconv>

#include "install/runtime/guarded.h"

namespace kz7 {
namespace {

struct Row {
    std::uint32_t number;
    std::string_view text;
};

// Prefixes and titles end in the blank that separates them from the rest of the line.
// clang-format off
constexpr std::array kTexts = {
    Row{ 997, "Output of %s: %s"},
    Row{ 999, "Error output of %s: %s"},
    Row{2000, "Installation started: "},
    Row{2001, "Installation ended: "},
    Row{2002, "WARNING: "},
    Row{2003, "Note: "},
    Row{2004, "ERROR: "},
    Row{2006, "The text of message %s is missing."},
    Row{2007, "Tasks: %s"},
    Row{2010, "%s, step %u"},
    Row{2011, "%s, step %u: %s"},
    Row{2012, "%s, step %u: error %u"},
    Row{2013, "%s, step %u: error %u: %s"},
    Row{2014, "%s: %s, status %u"},
    Row{2015, "There is no variable and no parameter named %s (line %u of the response file)."},
    Row{2020, "KZ7 Setup"},
    Row{2030, "%s ..."},
    Row{2031, "%s: done"},
    Row{2032, "Undoing what was done ..."},
    Row{2033, "Everything is undone."},
    Row{2034, "Error: %s"},
    Row{2035, "%s [%s] (ABORT to stop): "},
    Row{2036, "%s"},
    Row{2037, "The installation medium was not found. Where is it?"},
    Row{2040, "Saving the installer properties"},
    Row{2041, "Deleting the saved installer properties"},
    Row{2100, "Update started: "},
    Row{2101, "Update ended: "},
    Row{2200, "Removal started: "},
    Row{2201, "Removal ended: "},
    Row{2300, "Configuration started: "},
    Row{2301, "Configuration ended: "},
    Row{5002, "There is not enough memory."},
    Row{5003, "An argument is missing."},
    Row{5005, "The command names no program of a known type."},
    Row{5006, "The buffer is too small."},
    Row{5011, "There is no installer session."},
    Row{5021, "Something that is needed is missing."},
    Row{5030, "The program was not run, or it failed."},
    Row{5056, "The instance has no profile folder or no system configuration file."},
    Row{5057, "Could not set a database-manager parameter: %s=%s, instance %s, error %u"},
    Row{5058, "Database-manager parameter set: %s=%s, instance %s"},
    Row{5059, "Could not set a registry variable globally: %s=%s"},
    Row{5061, "A registry variable may not be set for an instance: %s=%s, instance %s"},
    Row{5062, "There is no registry variable of that name."},
    Row{5082, "The exit code of the program is not available."},
    Row{5094, "Could not set a registry variable for an instance: %s=%s, instance %s"},
    Row{5111, "A thread could not be started."},
    Row{5339, "A registry variable may not be set globally: %s=%s"},
    Row{5512, "Registry variable set: %s=%s %s"},
    Row{6045, "The installation database is not available."},
};
// clang-format on

static_assert(std::is_sorted(kTexts.begin(), kTexts.end(),
                             [](const Row& left, const Row& right) { return left.number < right.number; }));

std::string_view ownText(std::uint32_t number) {
    const auto* found = std::lower_bound(kTexts.begin(), kTexts.end(), number,
                                         [](const Row& row, std::uint32_t wanted) { return row.number < wanted; });
    return found != kTexts.end() && found->number == number ? found->text : std::string_view{};
}

// The placeholders of a text in order, one letter each.
std::string placeholders(std::string_view text) {
    std::string kinds;
    for (std::size_t at = text.find('%'); at != std::string_view::npos && at + 1 < text.size();
         at = text.find('%', at + (text[at + 1] == '%' ? 2 : 1))) {
        const char kind = text[at + 1];
        if (kind == 's' || kind == 'd' || kind == 'u') {
            kinds += kind;
        }
    }
    return kinds;
}

bool parseNumber(std::string_view name, std::uint32_t& number) {
    if (name == "GENERIC_DLG_TITLE") {
        number = kGenericDialogTitle;
        return true;
    }
    const auto end = std::from_chars(name.data(), name.data() + name.size(), number);
    return end.ec == std::errc{} && end.ptr == name.data() + name.size();
}

}  // namespace

Status MessageCatalogue::load(std::string_view file, ResponseFault& fault) {
    const Status status = guarded([&] { return loadLines(file, fault); });
    if (status == kNoMemory) {
        fault = {0, kNoMemoryReason};
    }
    return status;
}

Status MessageCatalogue::loadLines(std::string_view file, ResponseFault& fault) {
    std::vector<ResponseKeyword> rows;
    const Status status = parseResponseFile(file, rows, fault);
    if (status != kSuccess) {
        return status;
    }
    std::map<std::uint32_t, std::string> texts;
    for (ResponseKeyword& row : rows) {
        std::uint32_t number = 0;
        if (!parseNumber(row.name, number) || ownText(number).data() == nullptr) {
            fault = {row.line, "there is no message of that number"};
            return kInvalidData;
        }
        if (placeholders(row.value) != placeholders(ownText(number))) {
            fault = {row.line, "the placeholders are not those of the text it replaces"};
            return kInvalidData;
        }
        texts.insert_or_assign(number, std::move(row.value));
    }
    loaded_ = std::move(texts);
    return kSuccess;
}

std::string_view MessageCatalogue::pattern(std::uint32_t number) const {
    if (const auto found = loaded_.find(number); found != loaded_.end()) {
        return found->second;
    }
    return ownText(number);
}

std::string_view MessageCatalogue::plainText(std::uint32_t number) const {
    const std::string_view text = pattern(number);
    return placeholders(text).empty() ? text : std::string_view{};
}

Status MessageCatalogue::copyText(std::uint32_t number, std::span<const Insert> inserts, char* room, std::size_t size,
                                  std::size_t& length) const {
    const std::string_view text = pattern(number);
    if (text.data() == nullptr) {
        length = 0;
        return kNoInstallerSession;
    }
    length = composeInto(room, size, text, inserts);
    return length > size ? kBufferTooSmall : kSuccess;
}

}  // namespace kz7
