#include "install/src/registry/touched_rows.h"

#include <algorithm>
#include <set>

#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::size_t kFewRows = 8;  // of a key, searched one by one

// Numbers take 7 bits a byte, the low ones first; texts have their length before them.
void appendNumber(std::uint64_t number, std::string& part) {
    for (; number >= 0x80; number >>= 7) {
        part += static_cast<char>(number | 0x80);
    }
    part += static_cast<char>(number);
}

void appendText(std::string_view text, std::string& part) {
    appendNumber(text.size(), part);
    part.append(text);
}

// Reads what the functions above wrote. Everything is empty or 0 after a failure.
class PartReader {
public:
    explicit PartReader(std::string_view part) : rest_(part) {}

    bool isAtEnd() const { return rest_.empty(); }
    bool isFailed() const { return isFailed_; }

    std::uint64_t number() {
        std::uint64_t number = 0;
        for (int shift = 0; shift < 64; shift += 7) {
            if (rest_.empty()) {
                break;
            }
            const auto byte = static_cast<unsigned char>(rest_.front());
            rest_.remove_prefix(1);
            number |= std::uint64_t{byte & 0x7FU} << shift;
            if (byte < 0x80) {
                return number;
            }
        }
        return fail();
    }
    std::string_view text() {
        const std::uint64_t size = number();
        if (size > rest_.size()) {
            fail();
            return {};
        }
        const std::string_view text = rest_.substr(0, size);
        rest_.remove_prefix(size);
        return text;
    }
    std::optional<ValueState> state(bool exists) {
        if (!exists) {
            return std::nullopt;
        }
        const std::uint64_t type = number();
        return ValueState{ValueType{type}, std::string(text())};
    }
    std::uint64_t fail() {
        isFailed_ = true;
        rest_ = {};
        return 0;
    }

private:
    std::string_view rest_;
    bool isFailed_ = false;
};

// What a key and a row have in their first byte.
constexpr std::uint64_t kBefore = 1;
constexpr std::uint64_t kNow = 2;
constexpr std::uint64_t kRemoved = 4;  // a key that was removed in between

void appendState(const std::optional<ValueState>& state, std::string& part) {
    if (state) {
        appendNumber(static_cast<std::uint64_t>(state->type), part);
        appendText(state->data, part);
    }
}

void appendRecords(const TouchedRows::Key& key, bool isNow, Snapshot& snapshot, const std::vector<std::size_t>& order) {
    KeyRecord& record = snapshot.emplace_back();
    record.name = key.name;
    record.keyClass = isNow ? key.classNow : key.classBefore;
    for (const std::size_t place : order) {
        const TouchedRows::Row& row = key.rows[place];
        if (const auto& state = isNow ? row.current() : row.before; state) {
            record.values.push_back({row.name, state->type, state->data});
        }
    }
}

// The places of a key's rows in the order of their upper-cased names.
std::vector<std::size_t> orderOf(const TouchedRows::Key& key) {
    std::vector<std::pair<std::string, std::size_t>> folds;
    folds.reserve(key.rows.size());
    for (const TouchedRows::Row& row : key.rows) {
        folds.emplace_back(foldUpper(row.name), folds.size());
    }
    std::sort(folds.begin(), folds.end());
    std::vector<std::size_t> order;
    order.reserve(folds.size());
    for (const auto& [fold, place] : folds) {
        order.push_back(place);
    }
    return order;
}

}  // namespace

TouchedRows::Row* TouchedRows::Key::find(std::string_view value) {
    const bool isAscii = std::all_of(value.begin(), value.end(), [](char c) { return (c & 0x80) == 0; });
    if (rows.size() <= kFewRows && isAscii) {
        const auto found =
            std::find_if(rows.begin(), rows.end(), [&](const Row& row) { return equalsIgnoreCase(row.name, value); });
        return found == rows.end() ? nullptr : &*found;
    }
    if (byFold_ == nullptr) {
        byFold_ = std::make_unique<Places>();
    }
    for (std::size_t place = byFold_->size(); place < rows.size(); ++place) {
        byFold_->emplace(foldValueName(rows[place].name), place);
    }
    const auto found = byFold_->find(foldValueName(value));
    return found == byFold_->end() ? nullptr : &rows[found->second];
}

TouchedRows::Row& TouchedRows::Key::row(std::string_view value) {
    Row* const found = find(value);
    if (found != nullptr) {
        return *found;
    }
    Row& added = rows.emplace_back();
    added.name = value;
    return added;
}

void TouchedRows::Key::add(KeyValue&& existing) {
    Row& added = rows.emplace_back();
    added.name = std::move(existing.name);
    added.before = ValueState{existing.type, std::move(existing.data)};
}

TouchedRows::Key* TouchedRows::recent(std::string_view fullName) {
    for (Key* const key : recent_) {
        if (key != nullptr && key->name == fullName) {
            return key;
        }
    }
    return nullptr;
}

TouchedRows::Key* TouchedRows::find(std::string_view fullName) {
    if (Key* const known = recent(fullName); known != nullptr) {
        return known;
    }
    const auto found = keys_.find(walkPlace(fullName));
    if (found == keys_.end()) {
        return nullptr;
    }
    recent_[1] = &found->second;
    return recent_[1];
}

// Walks meet keys in their order, so the next one usually comes right after the last one.
TouchedRows::Key& TouchedRows::key(std::string_view fullName, bool& isNew) {
    if (Key* const known = recent(fullName); known != nullptr) {
        isNew = false;
        return *known;
    }
    const std::size_t count = keys_.size();
    last_ = keys_.try_emplace(last_ == keys_.end() ? last_ : std::next(last_), walkPlace(fullName));
    isNew = keys_.size() != count;
    if (isNew) {
        last_->second.name = fullName;
    }
    recent_[0] = &last_->second;
    return *recent_[0];
}

void TouchedRows::change(Key& key) {
    counted_.reset();
    if (!std::exchange(key.isChanged, true)) {
        changed_.push_back(&key);
    }
}

void TouchedRows::set(Key& key, Row& row, std::optional<ValueState> now) {
    row.isTouched = true;
    row.now = std::move(now);
    change(key);
}

void TouchedRows::create(Key& key, std::string_view keyClass) {
    key.wasRemoved = key.wasRemoved || (key.before && !key.now);
    key.now = true;
    key.classNow = keyClass;
    change(key);
}

void TouchedRows::remove(Key& key) {
    key.now = false;
    for (Row& row : key.rows) {
        row.isTouched = true;
        row.now.reset();
    }
    change(key);
}

void TouchedRows::exists(Key& key, bool now) {
    key.now = now;
    change(key);
}

ChangeSet TouchedRows::changes() const {
    Snapshot before;
    Snapshot now;
    for (const auto& [place, key] : keys_) {
        const std::vector<std::size_t> order = orderOf(key);
        if (key.before) {
            appendRecords(key, false, before, order);
        }
        if (key.now) {
            appendRecords(key, true, now, order);
        }
    }
    return difference(before, now);
}

ChangeCounts TouchedRows::counts() const {
    if (!counted_) {
        counted_ = count();
    }
    return *counted_;
}

ChangeCounts TouchedRows::count() const {
    ChangeCounts counts;
    std::set<std::string> services;
    for (const auto& [place, key] : keys_) {
        if (key.before && key.now && key.classBefore != key.classNow) {
            return countChanges(changes());  // all below it is replaced
        }
        const auto values = static_cast<std::size_t>(
            std::count_if(key.rows.begin(), key.rows.end(), [](const Row& row) { return row.differs(); }));
        const bool isChanged = key.before != key.now;
        if (const std::string_view service = serviceOf(key.name); service.empty()) {
            counts.values += values;
            counts.keys += isChanged ? 1 : 0;
        } else if (values != 0 || isChanged) {
            services.insert(foldUpper(service));
        }
    }
    counts.services = services.size();
    return counts;
}

std::string TouchedRows::takePart() {
    std::string part;
    std::vector<const Row*> rows;
    for (Key* const key : changed_) {
        key->isChanged = false;
        rows.clear();
        for (Row& row : key->rows) {
            if (key->wasRemoved || row.isKept || row.differs()) {
                row.isKept = true;
                rows.push_back(&row);
            }
        }
        if (!rows.empty() || key->isKept || key->before != key->now || key->wasRemoved) {
            key->isKept = true;
            appendTouched(*key, rows, TouchedForm::whole, part);
        }
    }
    changed_.clear();
    return part;
}

void appendTouched(const TouchedRows::Key& key, const std::vector<const TouchedRows::Row*>& rows, TouchedForm form,
                   std::string& part) {
    const bool isNow = key.now && form != TouchedForm::removal;
    const bool wasRemoved = key.wasRemoved && form == TouchedForm::whole;
    appendText(key.name, part);
    appendNumber((key.before ? kBefore : 0) | (isNow ? kNow : 0) | (wasRemoved ? kRemoved : 0), part);
    appendText(key.classBefore, part);
    appendText(key.classNow, part);
    appendNumber(rows.size(), part);
    for (const TouchedRows::Row* const row : rows) {
        static const std::optional<ValueState> kNone;
        const std::optional<ValueState>& now = form == TouchedForm::removal ? kNone : row->current();
        appendText(row->name, part);
        appendNumber((row->before ? kBefore : 0) | (now ? kNow : 0), part);
        appendState(row->before, part);
        appendState(now, part);
    }
}

bool TouchedRows::add(std::string_view part) {
    PartReader reader(part);
    while (!reader.isAtEnd()) {
        const std::string_view name = reader.text();
        KeyName parsed;
        if (!parseKeyName(name, parsed)) {
            return false;
        }
        bool isNew = false;
        Key& key = this->key(name, isNew);
        const std::uint64_t flags = reader.number();
        const std::string_view classBefore = reader.text();
        if (isNew) {
            key.before = key.now = (flags & kBefore) != 0;
            key.classBefore = key.classNow = classBefore;
        }
        const std::string_view classNow = reader.text();
        if ((flags & kNow) == 0) {
            remove(key);
        } else if (!key.now) {
            create(key, classNow);
        }
        key.wasRemoved = key.wasRemoved || (flags & kRemoved) != 0;
        key.classNow = classNow;
        for (std::uint64_t rows = reader.number(); rows > 0 && !reader.isFailed(); --rows) {
            const std::string_view rowName = reader.text();
            const std::size_t known = key.rows.size();
            Row& row = key.row(rowName);
            const std::uint64_t states = reader.number();
            std::optional<ValueState> before = reader.state((states & kBefore) != 0);
            if (key.rows.size() != known) {
                row.before = std::move(before);
            }
            set(key, row, reader.state((states & kNow) != 0));
        }
    }
    return !reader.isFailed();
}

}  // namespace kz7
