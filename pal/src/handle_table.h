#pragma once

#include <cstdint>
#include <unordered_map>
#include <utility>

#include "kept_nodes.h"

namespace korvel_pal {

/**
 * Gives objects handles that are numbers in the shape of a pointer and are never dereferenced, so
 * that a stale one is found out. Not synchronised; the addresses of the values are stable. What is
 * removed leaves its place in memory to what is added next.
 */
template <typename Handle, typename Value>
class HandleTable {
  public:
    Handle* add(const Value& value) {
        do {
            ++lastNumber;
        } while (lastNumber == 0 || values.count(lastNumber) != 0);
        kept.insert(values, lastNumber, value);
        return toHandle(lastNumber);
    }

    /** The value, or null when the handle is not a live one. */
    Value* find(const Handle* handle) {
        const auto found = values.find(toNumber(handle));
        return found == values.end() ? nullptr : &found->second;
    }

    bool remove(const Handle* handle) {
        const auto found = values.find(toNumber(handle));
        if (found == values.end()) {
            return false;
        }
        kept.keep(values.extract(found));
        return true;
    }

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

    using Values = std::unordered_map<std::uintptr_t, Value>;

    Values values;
    KeptNodes<Values> kept;
    std::uintptr_t lastNumber = 0;
};

}  // namespace korvel_pal
