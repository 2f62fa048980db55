#include "tests/support/registry_dump.h"

#include <cstdio>
#include <memory>

namespace kz7::test {
namespace {

std::string shown(std::string_view bytes) {
    std::string text;
    for (const char c : bytes) {
        if (c >= ' ' && c <= '~' && c != '\\') {
            text += c;
        } else {
            char escaped[8];
            std::snprintf(escaped, sizeof escaped, "\\x%02x", static_cast<unsigned char>(c));
            text += c == '\\' ? "\\" : escaped;
        }
    }
    return text;
}

class Dump {
public:
    Dump(IRegistryStore& registry, KeyHandle root) : registry_(registry), root_(root) {}

    void below(const std::string& path) {
        OwnedKey key(registry_);
        if (registry_.openKey(root_, path, kKeyRead, key.receive()) != kSuccess) {
            text += "[" + shown(path) + "] cannot be opened\n";
            return;
        }
        for (std::uint32_t i = 0; registry_.enumerateValue(key.get(), i, name_, &type_, &bytes_) == kSuccess; ++i) {
            text += shown(path) + " : " + shown(name_.view()) + " = " + std::to_string(static_cast<unsigned>(type_)) +
                    ":" + shown(bytes_.view()) + "\n";
        }
        for (std::uint32_t i = 0; registry_.enumerateKey(key.get(), i, name_, &class_) == kSuccess; ++i) {
            std::string subkey = path;
            subkey.append(path.empty() ? "" : "\\").append(name_.view());
            text += "[" + shown(subkey) + "] " + shown(class_.view()) + "\n";
            below(subkey);
        }
    }

    std::string text;

private:
    IRegistryStore& registry_;
    KeyHandle root_;
    static constexpr std::uint32_t kRoom = 1 << 20;
    std::unique_ptr<char[]> room_ = std::make_unique_for_overwrite<char[]>(kRoom);
    Buffer bytes_{room_.get(), kRoom};
    FixedBuffer<kMaxValueName + 1> name_;
    FixedBuffer<1024> class_;
    ValueType type_{};
};

}  // namespace

std::string dumpRegistry(IRegistryStore& registry, KeyHandle root, const std::string& path) {
    Dump dump(registry, root);
    dump.below(path);
    return dump.text;
}

}  // namespace kz7::test
