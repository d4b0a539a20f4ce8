#pragma once

#include <cstdint>
#include <unordered_map>
#include <utility>

namespace korvel_pal {

/**
 * Gives objects handles that are numbers in the shape of a pointer and are never dereferenced, so
 * that a stale one is found out. Not synchronised; the addresses of the values are stable.
 */
template <typename Handle, typename Value>
class HandleTable {
  public:
    Handle* add(Value value) {
        do {
            ++lastNumber;
        } while (lastNumber == 0 || values.count(lastNumber) != 0);
        values.emplace(lastNumber, std::move(value));
        return toHandle(lastNumber);
    }

    /** The value, or null when the handle is not a live one. */
    Value* find(const Handle* handle) {
        const auto found = values.find(toNumber(handle));
        return found == values.end() ? nullptr : &found->second;
    }

    bool remove(const Handle* handle) { return values.erase(toNumber(handle)) != 0; }

    template <typename Call>
    void forEach(Call call) {
        for (auto& entry : values) {
            call(toHandle(entry.first), entry.second);
        }
    }

  private:
    static std::uintptr_t toNumber(const Handle* handle) {
        return reinterpret_cast<std::uintptr_t>(handle);
    }
    static Handle* toHandle(std::uintptr_t number) {
        return reinterpret_cast<Handle*>(number);  // NOLINT(performance-no-int-to-ptr)
    }

    std::unordered_map<std::uintptr_t, Value> values;
    std::uintptr_t lastNumber = 0;
};

}  // namespace korvel_pal
