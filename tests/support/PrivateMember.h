/**
 * @file
 * Reaches a private member that no call can bring into the state that a test needs.
 */
#pragma once

namespace TestSupport {

/**
 * An explicit instantiation may name private members. In a test file, in this namespace:
 *
 *     struct Slot {
 *         using Type = Value Class::*;
 *         friend Type memberOf(Slot);
 *     };
 *     template struct PrivateMember<Slot, &Class::member>;
 *
 * Then `object.*memberOf(Slot())` is the member, and `(object.*memberOf(Slot()))(...)` calls it.
 */
template <typename Tag, typename Tag::Type POINTER>
struct PrivateMember {
    friend typename Tag::Type memberOf(Tag /*tag*/) { return POINTER; }
};

}  // namespace TestSupport
