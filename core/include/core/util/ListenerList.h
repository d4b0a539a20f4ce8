/**
 * @file
 * The one fan-out of the system.
 */
#pragma once

#include <algorithm>
#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <cstddef>
#include <new>
#include <vector>

namespace Util {

/**
 * Listeners held weakly, in the order of addition. Used under the event lock only.
 *
 * What holds of every notification:
 * - expired listeners are removed from the list first, where there is memory for that;
 * - the live ones are then called in the order of addition, each kept alive for its own call only;
 * - a listener that is added during the notification is first called by the next one;
 * - a listener that dies or is removed during the notification before its turn: a dead one is
 *   skipped, a removed one that lives is still called this once;
 * - the list itself may be destroyed by a listener; the notification goes on.
 */
template <typename Listener>
class ListenerList {
  public:
    /** Appends an entry, held weakly. The same listener may have several. */
    void add(const boost::weak_ptr<Listener>& listener) {
        change([&listener](Entries& changed) { changed.push_back(listener); });
    }

    /** Removes every entry of the listener. */
    void remove(const boost::weak_ptr<Listener>& listener) {
        removeIf([&listener](const boost::weak_ptr<Listener>& entry) {
            return !entry.owner_before(listener) && !listener.owner_before(entry);
        });
    }

    /** Entries, expired ones that no notification has removed yet included. */
    std::size_t size() const { return entries ? entries->size() : 0; }

    /** Calls `call(Listener&)` for each live listener. */
    template <typename Call>
    void notify(Call call) {
        removeExpired();
        const boost::shared_ptr<const Entries> snapshot = entries;
        if (!snapshot) {
            return;
        }
        for (const boost::weak_ptr<Listener>& entry : *snapshot) {
            if (const boost::shared_ptr<Listener> listener = entry.lock()) {
                call(*listener);
            }
        }
    }

  private:
    using Entries = std::vector<boost::weak_ptr<Listener>>;

    // Listeners must get their events all the same.
    void removeExpired() noexcept {
        try {
            removeIf([](const boost::weak_ptr<Listener>& entry) { return entry.expired(); });
        } catch (const std::bad_alloc&) {
            return;
        }
    }

    template <typename Condition>
    void removeIf(Condition condition) {
        if (entries && std::any_of(entries->begin(), entries->end(), condition)) {
            change([&condition](Entries& changed) {
                changed.erase(std::remove_if(changed.begin(), changed.end(), condition),
                              changed.end());
            });
        }
    }

    template <typename Change>
    void change(Change apply) {
        const auto changed =
            entries ? boost::make_shared<Entries>(*entries) : boost::make_shared<Entries>();
        apply(*changed);
        entries = changed;
    }

    // Replaced by each change, so that a notification keeps its list without a copy.
    boost::shared_ptr<const Entries> entries;
};

}  // namespace Util
