#pragma once

#include <array>
#include <cstddef>
#include <utility>

namespace korvel_pal {

/**
 * Keeps the nodes of what leaves a map for what is inserted next: a map whose size goes up and down
 * by a few entries does not allocate. Not synchronised.
 */
template <typename Map>
class KeptNodes {
  public:
    using Node = typename Map::node_type;

    /** Inserts what the map does not have yet. */
    void insert(Map& map, const typename Map::key_type& key,
                const typename Map::mapped_type& value) {
        if (count == 0) {
            map.emplace(key, value);
            return;
        }
        Node node = std::move(nodes[--count]);
        node.key() = key;
        node.mapped() = value;
        map.insert(std::move(node));
    }

    /** Takes what was extracted from the map; its value is given up. */
    void keep(Node node) {
        if (count < nodes.size()) {
            node.mapped() = typename Map::mapped_type();
            nodes[count++] = std::move(node);
        }
    }

  private:
    std::array<Node, 16> nodes;
    std::size_t count = 0;
};

}  // namespace korvel_pal
