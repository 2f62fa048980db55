#include "install/platform/windows/run_journal.h"

#include <charconv>

namespace kz7 {
namespace {

constexpr std::string_view kMark = "KZ7 history 1\n";
constexpr std::size_t kHeadSize = 12;  // of a record: its length and its sum

std::uint64_t sumOf(std::uint64_t before, std::string_view bytes) {
    std::uint64_t sum = before ^ 0xCBF29CE484222325;
    for (const char byte : bytes) {
        sum = (sum ^ static_cast<unsigned char>(byte)) * 0x100000001B3;
    }
    return sum;
}

void appendBytes(std::uint64_t number, int count, std::string& bytes) {
    for (; count > 0; --count, number >>= 8) {
        bytes += static_cast<char>(number & 0xFF);
    }
}

std::uint64_t numberOf(std::string_view bytes) {
    std::uint64_t number = 0;
    for (std::size_t at = bytes.size(); at-- > 0;) {
        number = number << 8 | static_cast<unsigned char>(bytes[at]);
    }
    return number;
}

// Fields of a record as texts.
class Fields {
public:
    explicit Fields(std::string_view content) : texts_(splitTexts(content)) {}

    std::string text() { return next_ < texts_.size() ? texts_[next_++] : std::string{}; }
    template <typename Number>
    Number number() {
        const std::string digits = text();
        Number number = 0;
        std::from_chars(digits.data(), digits.data() + digits.size(), number);
        return number;
    }
    std::vector<std::string> rest() { return {texts_.begin() + static_cast<std::ptrdiff_t>(next_), texts_.end()}; }

private:
    std::vector<std::string> texts_;
    std::size_t next_ = 0;
};

void readRecord(JournalRecord kind, std::string_view content, std::string_view machine, HistoryRun& run,
                HistoryChanges& changes) {
    Fields fields(content);
    switch (kind) {
        case JournalRecord::run:
            run.isForeign = fields.text() != machine;
            run.parent = fields.number<std::uint64_t>();
            run.undoes = fields.number<std::uint64_t>();
            run.begun = fields.number<std::int64_t>();
            run.user = fields.text();
            run.host = fields.text();
            run.program = fields.text();
            run.arguments = fields.rest();
            break;
        case JournalRecord::change:
            changes.parts.emplace_back(content);
            break;
        case JournalRecord::note:
            run.outside.emplace_back(content);
            break;
        case JournalRecord::end:
            run.state = RunState::ended;
            run.status = fields.number<Status>();
            run.ended = fields.number<std::int64_t>();
            run.counts.values = fields.number<std::size_t>();
            run.counts.keys = fields.number<std::size_t>();
            run.counts.services = fields.number<std::size_t>();
            break;
    }
}

}  // namespace

std::string JournalWriter::record(JournalRecord kind, std::string_view content) {
    const std::string body = static_cast<char>(kind) + std::string(content);
    sum_ = sumOf(sum_, body);
    std::string record;
    appendBytes(body.size(), 4, record);
    appendBytes(sum_, 8, record);
    return record + body;
}

std::string journalHead(JournalWriter& writer, const HistoryRun& run, std::string_view machine) {
    std::vector<std::string> fields = {std::string(machine),
                                       std::to_string(run.parent),
                                       std::to_string(run.undoes),
                                       std::to_string(run.begun),
                                       run.user,
                                       run.host,
                                       run.program};
    fields.insert(fields.end(), run.arguments.begin(), run.arguments.end());
    return std::string(kMark) + writer.record(JournalRecord::run, joinTexts(fields));
}

std::string journalEnd(JournalWriter& writer, Status status, std::int64_t ended, const ChangeCounts& counts) {
    return writer.record(JournalRecord::end,
                         joinTexts({std::to_string(status), std::to_string(ended), std::to_string(counts.values),
                                    std::to_string(counts.keys), std::to_string(counts.services)}));
}

Status readJournal(std::string_view bytes, std::string_view machine, HistoryRun& run, HistoryChanges& changes) {
    run.state = RunState::interrupted;
    changes = {};
    changes.isLastUncertain = true;
    if (!bytes.starts_with(kMark)) {
        return kMark.starts_with(bytes) ? kFileNotFound : kInvalidData;
    }
    std::uint64_t sum = 0;
    bool isFirst = true;
    for (bytes.remove_prefix(kMark.size()); bytes.size() > kHeadSize; isFirst = false) {
        const std::uint64_t size = numberOf(bytes.substr(0, 4));
        const std::string_view body = bytes.substr(kHeadSize, size);
        const bool isLast = bytes.size() <= kHeadSize + size;
        sum = sumOf(sum, body);
        if (size == 0 || body.size() != size || sum != numberOf(bytes.substr(4, 8))) {
            // What a power cut leaves of the last record may be longer than the file.
            if (!isLast) {
                return kInvalidData;
            }
            break;
        }
        const auto kind = static_cast<JournalRecord>(body.front());
        if (isFirst != (kind == JournalRecord::run) || run.state == RunState::ended) {
            return kInvalidData;
        }
        readRecord(kind, body.substr(1), machine, run, changes);
        bytes.remove_prefix(kHeadSize + size);
    }
    changes.isLastUncertain = run.state != RunState::ended;
    return changes.parts.empty() ? kFileNotFound : kSuccess;
}

}  // namespace kz7
