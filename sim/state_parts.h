#pragma once
#include <memory>
#include <utility>
#include <vector>

namespace tav::sim {

// The state of each subsystem, kept next to its commands as a typed record
// of its own: a subsystem adds its record without touching anybody else's.
// A record is made, with its type's default values, the first time it is
// asked for; the controller's lock guards all of them.
class StateParts {
public:
    StateParts() = default;
    StateParts(StateParts&&) noexcept = default;
    StateParts& operator=(StateParts&&) noexcept = default;
    StateParts(const StateParts&) = delete;
    StateParts& operator=(const StateParts&) = delete;

    template <typename T>
    T& Get() const {
        const void* key = KeyOf<T>();
        for (const auto& part : parts_) {
            if (part.key == key) {
                return static_cast<Holder<T>&>(*part.holder).value;
            }
        }
        auto holder = std::make_unique<Holder<T>>();
        T& value = holder->value;
        parts_.push_back({key, std::move(holder)});
        return value;
    }

private:
    struct HolderBase {
        virtual ~HolderBase() = default;
    };
    template <typename T>
    struct Holder final : HolderBase {
        T value{};
    };
    struct Entry {
        const void* key;
        std::unique_ptr<HolderBase> holder;
    };

    // One address per type, the same in every translation unit.
    template <typename T>
    static const void* KeyOf() {
        static const char key = 0;
        return &key;
    }

    // Records come into being on first use, also from a reader's const view.
    mutable std::vector<Entry> parts_;
};

}  // namespace tav::sim
