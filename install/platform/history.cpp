#include "install/platform/history.h"

namespace kz7 {

std::string joinTexts(const std::vector<std::string>& texts) {
    std::string all;
    for (const std::string& text : texts) {
        all.append(text).append(1, '\0');
    }
    return all;
}

std::vector<std::string> splitTexts(std::string_view all) {
    std::vector<std::string> texts;
    for (std::size_t end = 0; (end = all.find('\0')) != std::string_view::npos; all.remove_prefix(end + 1)) {
        texts.emplace_back(all.substr(0, end));
    }
    return texts;
}

}  // namespace kz7
