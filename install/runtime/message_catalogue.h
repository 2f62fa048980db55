// The texts of the installer runtime by number: built-in English texts, which a file may replace for another language.
#pragma once

#include <cstdint>
#include <map>
#include <span>
#include <string>
#include <string_view>

#include "install/platform/status.h"
#include "install/platform/text.h"
#include "install/runtime/response_file.h"

namespace kz7 {

// clang-format off
inline constexpr std::uint32_t kHeaderTitles          = 2000;  // + 1 for the trailer; + 100 for each further kind of run
inline constexpr std::uint32_t kWarningPrefix         = 2002;
inline constexpr std::uint32_t kNotePrefix            = 2003;
inline constexpr std::uint32_t kErrorPrefix           = 2004;
inline constexpr std::uint32_t kMissingTextMessage    = 2006;
inline constexpr std::uint32_t kReportMessage         = 2010;  // function, probe
inline constexpr std::uint32_t kReportTextMessage     = 2011;  // function, probe, text
inline constexpr std::uint32_t kReportValueMessage    = 2012;  // function, probe, value
inline constexpr std::uint32_t kReportBothMessage     = 2013;  // function, probe, value, text
inline constexpr std::uint32_t kTaskListMessage       = 2007;  // the list
inline constexpr std::uint32_t kPropertyMessage       = 2014;  // operation, property, status
inline constexpr std::uint32_t kUnknownNameMessage    = 2015;  // name, line of the response file
inline constexpr std::uint32_t kGenericDialogTitle    = 2020;  // named GENERIC_DLG_TITLE in catalogue files
inline constexpr std::uint32_t kTaskStartMessage      = 2030;  // description
inline constexpr std::uint32_t kTaskEndMessage        = 2031;  // description
inline constexpr std::uint32_t kUndoStartMessage      = 2032;
inline constexpr std::uint32_t kUndoEndMessage        = 2033;
inline constexpr std::uint32_t kErrorMessage          = 2034;  // text
inline constexpr std::uint32_t kQuestionMessage       = 2035;  // text, default value
inline constexpr std::uint32_t kTextMessage           = 2036;  // text
inline constexpr std::uint32_t kMediumNeededMessage   = 2037;
inline constexpr std::uint32_t kSavingMessage         = 2040;
inline constexpr std::uint32_t kDeletingMessage       = 2041;
// clang-format on

class MessageCatalogue {
public:
    // Reads the texts of a catalogue file, which replace the built-in ones: the lines of a response file, with a number
    // or GENERIC_DLG_TITLE as the name. A text has the placeholders of the one it replaces, in the same order. On
    // failure, kInvalidData or kNoMemory, the texts stay as they are and `fault` has the reason.
    Status load(std::string_view file, ResponseFault& fault);

    // Copies the text with its inserts. Results as for UREInfo::copyText().
    Status copyText(std::uint32_t number, std::span<const Insert> inserts, char* room, std::size_t size,
                    std::size_t& length) const;

    // The text with its placeholders; empty for a missing one.
    std::string_view pattern(std::uint32_t number) const;

    // The text if it has no placeholders; else empty.
    std::string_view plainText(std::uint32_t number) const;

private:
    Status loadLines(std::string_view file, ResponseFault& fault);

    std::map<std::uint32_t, std::string> loaded_;
};

}  // namespace kz7
