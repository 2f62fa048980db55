// The version aliases for 10 to 100,000 copies: their computation compared with one pass over the sorted version texts,
// for versions of several shapes, and over the records of the copies; and the whole rewrite on the embedded store
// compared with a bare SQLite program that reads and writes the same rows of the same file.
#include <benchmark/benchmark.h>
#include <sqlite3.h>

#include <algorithm>
#include <array>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "bench/scratch.h"
#include "install/platform/embedded/ports.h"
#include "install/platform/embedded/registry.h"
#include "install/src/copies/alias_rewrite.h"

namespace kz7 {
namespace {

using SortedCopies = std::map<std::string, std::string>;  // version text -> name

// The debugger output of this machine, which nobody reads.
struct Debug {
    const std::unique_ptr<IConsole> console = standardConsole();
    const std::unique_ptr<IDebugOutput> output = hostDebugOutput(*console, nullptr);
};

void require(bool condition, const char* what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

using Version = std::array<std::string, 4>;  // its four fields

// 100 fix levels for each modification.
Version balanced(std::int64_t copy) {
    return {"9", std::to_string(copy / 10000), std::to_string(copy / 100 % 100), std::to_string(copy % 100)};
}

// Ten texts, each a prefix of the next.
Version prefixesOfOneAnother(std::int64_t copy) {
    std::string fixLevel = "0";
    for (std::int64_t more = 0; more < copy % 10; ++more) {
        fixLevel += ".1";
    }
    return {"9", std::to_string(copy / 1000), std::to_string(copy / 10 % 100), fixLevel};
}

// Balanced; each fix level is a word whose letters have either case.
Version bothCases(std::int64_t copy) {
    std::string word = "fixpack";
    const std::uint64_t spelling = static_cast<std::uint64_t>(copy) * 0x9E3779B97F4A7C15U >> 32U;
    for (std::size_t letter = 0; letter < word.size(); ++letter) {
        word[letter] = (spelling >> letter & 1U) != 0 ? foldUpper(word[letter]) : word[letter];
    }
    Version version = balanced(copy);
    version[3] = word + std::to_string(copy % 25);
    return version;
}

// The same word in a single modification.
Version bothCasesTogether(std::int64_t copy) {
    return {"9", "7", "0", bothCases(copy)[3] + std::to_string(copy / 4)};
}

using Shape = Version (*)(std::int64_t copy);

// A state directory with that many copies and their aliases.
class StoreWithCopies {
public:
    StoreWithCopies(std::int64_t copies, Shape shape) {
        const auto registry = open();
        for (std::int64_t copy = 0; copy < copies; ++copy) {
            addCopy(*registry, copy, shape(copy));
        }
        OwnedKey key(*registry);
        registry->createKey(KeyHandle::localMachine, layout::kCopies32, {}, kKeyFull, key.receive());
        require(InstallCopiesProfile(*registry, *debug_.output).run() == kSuccess && registry->commit() == kSuccess,
                "the store cannot be laid out");
    }

    std::unique_ptr<EmbeddedRegistry> open() const {
        return std::make_unique<EmbeddedRegistry>(scratch_.path(), false, [](const StoreFault&) {});
    }
    std::string file() const { return scratch_.file("registry.db"); }

private:
    static void addCopy(IRegistryStore& registry, std::int64_t copy, const Version& version) {
        constexpr std::array<const char*, 4> kNames = {"Version", "Release", "Modification", "Fix Level"};
        const std::string path = std::string(layout::kCopies) + "\\COPY" + std::to_string(copy) + "\\CurrentVersion";
        OwnedKey key(registry);
        registry.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key.receive());
        for (std::size_t field = 0; field < kNames.size(); ++field) {
            const std::string& text = version[field];
            registry.setValue(key.get(), kNames[field], ValueType::sz, {text.c_str(), text.size() + 1});
        }
    }

    Scratch scratch_;
    Debug debug_;
};

// Keeps the last store: the library calls a benchmark again for each estimate of its length.
const StoreWithCopies& storeWith(std::int64_t copies, Shape shape) {
    static std::unique_ptr<StoreWithCopies> kept;
    static std::pair<std::int64_t, Shape> what;
    if (kept == nullptr || what != std::pair(copies, shape)) {
        kept.reset();
        kept = std::make_unique<StoreWithCopies>(copies, shape);
        what = {copies, shape};
    }
    return *kept;
}

// Assigns every prefix to the greatest text that has it, the minimum of work. Ignores case and skips the prefixes that
// a text shares with its neighbour.
template <class Copies>
void onePass(const Copies& copies, AliasMap& aliases) {
    std::string_view greater;
    for (auto copy = copies.rbegin(); copy != copies.rend(); ++copy) {
        const std::string_view text = copy->first;
        for (std::size_t dot = text.find('.', commonLength(text, greater)); dot != std::string_view::npos;
             dot = text.find('.', dot + 1)) {
            aliases.emplace(text.substr(0, dot), copy->second);
        }
        aliases.emplace(text, copy->second);
        greater = text;
    }
}

void onePassOverSortedTexts(benchmark::State& state, Shape shape) {
    const auto registry = storeWith(state.range(0), shape).open();
    Debug debug;
    InstallCopiesProfile profile(*registry, *debug.output);
    require(profile.generateInstallCopiesList() == kSuccess, "no copies");
    AliasMap aliases;
    for (auto _ : state) {
        aliases.clear();
        onePass(profile.copiesByVersion(), aliases);
        benchmark::DoNotOptimize(aliases);
    }
    profile.generateProfileInfo();
    // With letters or whole versions the copies may differ.
    require(shape == balanced ? aliases == profile.profileInfo() : aliases.size() == profile.profileInfo().size(),
            "both compute the same");
    state.SetComplexityN(state.range(0));
}

void aliasesComputed(benchmark::State& state, Shape shape) {
    const auto registry = storeWith(state.range(0), shape).open();
    Debug debug;
    InstallCopiesProfile profile(*registry, *debug.output);
    require(profile.generateInstallCopiesList() == kSuccess, "no copies");
    for (auto _ : state) {
        profile.generateProfileInfo();
        benchmark::DoNotOptimize(profile.profileInfo());
    }
    state.SetComplexityN(state.range(0));
}

void aliasRewrite(benchmark::State& state) {
    const StoreWithCopies& store = storeWith(state.range(0), balanced);
    Debug debug;
    for (auto _ : state) {
        const auto registry = store.open();
        require(InstallCopiesProfile(*registry, *debug.output).run() == kSuccess && registry->commit() == kSuccess,
                "the rewrite failed");
    }
    state.SetComplexityN(state.range(0));
}

// The rewrite in a program for this file only: prepared statements, each row found by its key, one cursor for the
// subkeys and one for the values of each view.
class BareProgram {
public:
    explicit BareProgram(const std::string& file) {
        require(sqlite3_open(file.c_str(), &connection_) == SQLITE_OK, "the store cannot be opened");
        run("PRAGMA synchronous = FULL; PRAGMA wal_autocheckpoint = 0");
        child_ = prepare("SELECT id FROM key WHERE parent = ? AND fold = ?");
        children_ = prepare("SELECT name, fold FROM key WHERE parent = ? ORDER BY fold");
        value_ = prepare("SELECT data FROM value WHERE key = ? AND fold = ?");
        values_ = prepare("SELECT name, data FROM value WHERE key = ? ORDER BY place");
        remove_ = prepare("DELETE FROM value WHERE key = ? AND fold = ?");
        insert_ = prepare(
            "INSERT INTO value (key, fold, name, type, data, place) VALUES (?1, ?2, ?2, 1, ?3,"
            " (SELECT coalesce(max(place), 0) + 1 FROM value WHERE key = ?1))");
    }
    BareProgram(const BareProgram&) = delete;
    BareProgram& operator=(const BareProgram&) = delete;
    ~BareProgram() {
        for (sqlite3_stmt* statement : {child_, children_, value_, values_, remove_, insert_}) {
            sqlite3_finalize(statement);
        }
        sqlite3_exec(connection_, "PRAGMA wal_checkpoint(TRUNCATE)", nullptr, nullptr, nullptr);
        sqlite3_close(connection_);
    }

    void rewrite() {
        run("BEGIN IMMEDIATE");
        const std::int64_t keys[] = {follow({"SOFTWARE", "NVQ", "KZ7", "INSTALLEDCOPIES"}),
                                     follow({"SOFTWARE", "WOW6432NODE", "NVQ", "KZ7", "INSTALLEDCOPIES"})};
        AliasMap old[] = {readAliases(keys[0]), readAliases(keys[1])};
        AliasMap aliases;
        onePass(readCopies(keys[0]), aliases);
        for (const int view : {0, 1}) {
            for (const auto& [name, copy] : old[view]) {
                bind(remove_, keys[view], name);
                finish(remove_);
            }
        }
        for (const auto& [prefix, copy] : aliases) {
            for (const std::int64_t key : keys) {
                bind(insert_, key, prefix);
                sqlite3_bind_blob(insert_, 3, copy.data(), static_cast<int>(copy.size()), SQLITE_STATIC);
                finish(insert_);
            }
        }
        run("COMMIT");
    }

private:
    void run(const char* sql) { require(sqlite3_exec(connection_, sql, nullptr, nullptr, nullptr) == SQLITE_OK, sql); }
    sqlite3_stmt* prepare(const char* sql) {
        sqlite3_stmt* statement = nullptr;
        require(sqlite3_prepare_v3(connection_, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) == SQLITE_OK,
                sql);
        return statement;
    }
    static void bind(sqlite3_stmt* statement, std::int64_t key, std::string_view fold) {
        sqlite3_bind_int64(statement, 1, key);
        sqlite3_bind_text(statement, 2, fold.data(), static_cast<int>(fold.size()), SQLITE_STATIC);
    }
    static void finish(sqlite3_stmt* statement) {
        require(sqlite3_step(statement) == SQLITE_DONE, "a row could not be written");
        sqlite3_reset(statement);
    }
    static std::string text(sqlite3_stmt* statement, int column) {
        const auto* bytes = static_cast<const char*>(sqlite3_column_blob(statement, column));
        const auto size = static_cast<std::size_t>(sqlite3_column_bytes(statement, column));
        return bytes == nullptr ? std::string{} : std::string(bytes, size);
    }
    std::int64_t find(std::int64_t parent, std::string_view fold) {
        bind(child_, parent, fold);
        require(sqlite3_step(child_) == SQLITE_ROW, "a key is missing");
        const std::int64_t id = sqlite3_column_int64(child_, 0);
        sqlite3_reset(child_);
        return id;
    }
    std::int64_t follow(std::initializer_list<std::string_view> names) {
        std::int64_t id = 1;
        for (const std::string_view name : names) {
            id = find(id, name);
        }
        return id;
    }
    AliasMap readAliases(std::int64_t key) {
        AliasMap aliases;
        sqlite3_bind_int64(values_, 1, key);
        while (sqlite3_step(values_) == SQLITE_ROW) {
            std::string name = text(values_, 0);
            if (isAliasName(name)) {
                aliases.emplace(std::move(name), text(values_, 1));
            }
        }
        sqlite3_reset(values_);
        return aliases;
    }
    SortedCopies readCopies(std::int64_t key) {
        SortedCopies copies;
        sqlite3_bind_int64(children_, 1, key);
        while (sqlite3_step(children_) == SQLITE_ROW) {
            const std::int64_t version = find(find(key, text(children_, 1)), "CURRENTVERSION");
            std::string joined;
            for (const std::string_view field : {"VERSION", "RELEASE", "MODIFICATION", "FIX LEVEL"}) {
                bind(value_, version, field);
                require(sqlite3_step(value_) == SQLITE_ROW, "a value is missing");
                joined += joined.empty() ? "" : ".";
                // The stored text ends with a NUL, which c_str() cuts off.
                joined += text(value_, 0).c_str();  // NOLINT(readability-redundant-string-cstr)
                sqlite3_reset(value_);
            }
            copies.insert_or_assign(std::move(joined), text(children_, 0));
        }
        sqlite3_reset(children_);
        return copies;
    }

    sqlite3* connection_ = nullptr;
    sqlite3_stmt* child_;
    sqlite3_stmt* children_;
    sqlite3_stmt* value_;
    sqlite3_stmt* values_;
    sqlite3_stmt* remove_;
    sqlite3_stmt* insert_;
};

void bareSqliteRewrite(benchmark::State& state) {
    const StoreWithCopies& store = storeWith(state.range(0), balanced);
    for (auto _ : state) {
        BareProgram(store.file()).rewrite();
    }
    state.SetComplexityN(state.range(0));
}

void sizes(benchmark::internal::Benchmark* benchmark) {
    benchmark->RangeMultiplier(10)->Range(10, 100000)->Complexity()->UseRealTime()->Unit(benchmark::kMicrosecond);
}

void addShape(const std::string& name, Shape shape) {
    sizes(benchmark::RegisterBenchmark(("onePassOverSortedTexts/" + name).c_str(), onePassOverSortedTexts, shape));
    sizes(benchmark::RegisterBenchmark(("aliasesComputed/" + name).c_str(), aliasesComputed, shape));
}

const bool kShapesAdded = [] {
    addShape("balanced", balanced);
    addShape("prefixesOfOneAnother", prefixesOfOneAnother);
    addShape("bothCases", bothCases);
    addShape("bothCasesTogether", bothCasesTogether);
    return true;
}();
BENCHMARK(bareSqliteRewrite)->Apply(sizes);
BENCHMARK(aliasRewrite)->Apply(sizes);

}  // namespace
}  // namespace kz7
