#include "install/runtime/infos.h"

#include <algorithm>
#include <cstdio>

#include "install/runtime/message_catalogue.h"

namespace kz7 {

UREInfo::UREInfo(const MessageCatalogue& catalogue, std::uint32_t code, std::uint32_t textNumber,
                 std::span<const Insert> inserts)
    : catalogue_(catalogue), code_(code), textNumber_(textNumber), insertCount_(std::min(inserts.size(), kMaxInserts)) {
    std::copy_n(inserts.begin(), insertCount_, inserts_.begin());
}

Status UREInfo::copyText(char* room, std::size_t size, std::size_t& length) const {
    return catalogue_.copyText(textNumber_, inserts(), room, size, length);
}

void UREInfo::copyText(FixedText<kMessageSize>& text) const {
    char room[kBytesOfCharacter * kMessageSize];
    std::size_t length = 0;
    if (copyText(room, sizeof room, length) == kNoInstallerSession) {
        copyMissingText(text);
    } else {
        text.assign({room, std::min(length, sizeof room)});
    }
}

void UREInfo::copyMissingText(FixedText<kMessageSize>& text) const {
    char code[16];
    std::snprintf(code, sizeof code, "0x%07x", static_cast<unsigned>(code_));
    const Insert insert = std::string_view(code);
    char room[kBytesOfCharacter * kMessageSize];
    std::size_t length = 0;
    catalogue_.copyText(kMissingTextMessage, {&insert, 1}, room, sizeof room, length);
    text.assign({room, std::min(length, sizeof room)});
}

std::string_view UREInfo::taskList() const {
    const bool given = code_ == kCodeTaskList && insertCount_ != 0;
    const auto* text = given ? std::get_if<std::string_view>(inserts_.data()) : nullptr;
    return text != nullptr ? *text : std::string_view{};
}

void UREInfo::setResponse(const char* text) {
    response_ = text == nullptr ? Response::aborted : Response::answered;
    answer_.assign(text == nullptr ? std::string_view{} : text);
}

}  // namespace kz7
