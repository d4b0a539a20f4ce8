/**
 * @file
 * The one fan-out of the system.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <cstddef>
#include <list>

namespace Util {

/**
 * Listeners held weakly, in the order of addition. Used under the event lock only.
 *
 * What holds of every notification:
 * - expired listeners are removed from the list first;
 * - the live ones are then called in the order of addition, each kept alive for its own call only;
 * - a listener that is added during the notification is first called by the next one;
 * - a listener that dies or is removed during the notification before its turn: a dead one is
 *   skipped, a removed one that lives is still called this once;
 * - the list itself may be destroyed by a listener; the notification goes on over its copy.
 */
template <typename Listener>
class ListenerList {
  public:
    void add(const boost::weak_ptr<Listener>& listener) { entries.push_back(listener); }

    /** Removes every entry of the listener. */
    void remove(const boost::weak_ptr<Listener>& listener) {
        entries.remove_if([&listener](const boost::weak_ptr<Listener>& entry) {
            return !entry.owner_before(listener) && !listener.owner_before(entry);
        });
    }

    /** Entries, expired ones that no notification has removed yet included. */
    std::size_t size() const { return entries.size(); }

    /** Calls `call(Listener&)` for each live listener. */
    template <typename Call>
    void notify(Call call) {
        entries.remove_if([](const boost::weak_ptr<Listener>& entry) { return entry.expired(); });
        const std::list<boost::weak_ptr<Listener>> snapshot(entries);
        for (const boost::weak_ptr<Listener>& entry : snapshot) {
            if (const boost::shared_ptr<Listener> listener = entry.lock()) {
                call(*listener);
            }
        }
    }

  private:
    std::list<boost::weak_ptr<Listener>> entries;
};

}  // namespace Util
