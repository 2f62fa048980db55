// The arguments of port calls as text, for observers.
#pragma once

#include <cstdio>
#include <string>
#include <string_view>
#include <type_traits>

#include "install/platform/buffer.h"
#include "install/platform/process_host.h"
#include "install/platform/service_manager.h"
#include "install/platform/text.h"

namespace kz7::test {

inline std::string quotedText(std::string_view text) {
    return '"' + shownText(text) + '"';
}

// Small numbers in decimal; handles of roots, rights and the like in hexadecimal.
inline std::string numberText(std::uint64_t number) {
    char text[24];
    std::snprintf(text, sizeof text, number < 0x10000 ? "%llu" : "%#llx", static_cast<unsigned long long>(number));
    return text;
}

// `Parameter` is the type that the port declares. `isWritten`: the call succeeded, so that its outputs hold a result.
template <typename Parameter>
std::string argumentText(const std::remove_reference_t<Parameter>& argument, bool isWritten) {
    using Value = std::remove_cvref_t<Parameter>;
    constexpr bool kIsOutput =
        std::is_lvalue_reference_v<Parameter> && !std::is_const_v<std::remove_reference_t<Parameter>>;
    if constexpr (std::is_pointer_v<Value> && std::is_object_v<std::remove_pointer_t<Value>>) {
        return argument == nullptr ? "null" : argumentText<std::remove_pointer_t<Value>&>(*argument, isWritten);
    } else if constexpr (std::is_same_v<Value, ServiceDefinition>) {
        return quotedText(argument.name) + ' ' + quotedText(argument.programPath);
    } else if constexpr (std::is_same_v<Value, ProcessStart>) {
        return quotedText(argument.commandLine);
    } else if (kIsOutput && !isWritten) {
        return "?";
    } else if constexpr (std::is_same_v<Value, Buffer>) {
        return quotedText(argument.view());
    } else if constexpr (std::is_same_v<Value, ProcessInformation>) {
        return numberText(argument.processId);
    } else if constexpr (std::is_enum_v<Value> || std::is_integral_v<Value>) {
        return numberText(static_cast<std::uint64_t>(argument));
    } else if constexpr (std::is_convertible_v<const Value&, std::string_view>) {
        return quotedText(argument);
    } else {
        return "...";  // functions and threads have no text
    }
}

}  // namespace kz7::test
