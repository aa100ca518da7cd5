// The keyed maps: a duplicate key, a missing key and a failed allocation become exceptions, after a log line
// where one is given. After any of them the map is unchanged.
#pragma once

#include <map>
#include <new>
#include <utility>

#include "foundation/exceptions.hpp"
#include "foundation/integers.hpp"
#include "foundation/log.hpp"
#include "foundation/zeb_string.hpp"

template <typename Key, typename Value>
struct ZebMap {
    using Map = std::map<Key, Value>;

    // Copies the pair into the map. Throws ExistsEx when the key is there already, NoMemoryEx "No Memory\n".
    static void insert(Map& map, const Key& key, const Value& value) {
        bool inserted = false;
        try {
            inserted = map.insert(std::make_pair(key, value)).second;
        } catch (const std::bad_alloc&) {
            throw NoMemoryEx("No Memory\n");
        }
        if (!inserted) {
            logPrintf("Element already existed in the map\n");
            throw ExistsEx("Element already exists in map.. can't insert\n");
        }
    }

    // The stored value, owned by the map. Throws NotFoundEx.
    static Value& lookup(Map& map, const Key& key) {
        const auto found = map.find(key);
        if (found == map.end()) {
            logPrintf("Element does not exist in the map\n");
            throw NotFoundEx("No element for the key exists in map\n");
        }
        return found->second;
    }

    static bool contains(const Map& map, const Key& key) { return map.find(key) != map.end(); }
};

template <typename Value>
using ZebStringMap = ZebMap<ZebString, Value>;

// A map of maps: a 32-bit outer key (a hash), and a string as inner key.
template <typename Value>
struct ZebTwoLevelMap {
    using Map = std::map<uint32, std::map<ZebString, Value>>;

    // Copies the value in; one that is already there under both keys stays. Throws ZebNotFoundEx "No Memory"
    // when memory runs out.
    static void insert(Map& map, uint32 outerKey, const ZebString& innerKey, const Value& value) {
        try {
            const auto outer = map.find(outerKey);
            if (outer != map.end()) {
                outer->second.insert(std::make_pair(innerKey, value));
                return;
            }
            // Filled before it goes in: no outer key may be left behind without an entry.
            std::map<ZebString, Value> inner;
            inner.insert(std::make_pair(innerKey, value));
            map.emplace(outerKey, std::move(inner));
        } catch (const std::bad_alloc&) {
            throw ZebNotFoundEx("No Memory");
        }
    }

    // The stored value, owned by the map. Throws ZebNotFoundEx.
    static Value& lookup(Map& map, uint32 outerKey, const ZebString& innerKey) {
        const auto outer = map.find(outerKey);
        if (outer == map.end()) {
            logPrintf("Element does not exist in the map");
            throw ZebNotFoundEx("No element for the key exists in map");
        }
        const auto inner = outer->second.find(innerKey);
        if (inner == outer->second.end()) {
            logPrintf("Element does not exist in the map2");
            throw ZebNotFoundEx("No element for the key exists in map2");
        }
        return inner->second;
    }

    static bool contains(const Map& map, uint32 outerKey, const ZebString& innerKey) {
        const auto outer = map.find(outerKey);
        return outer != map.end() && outer->second.find(innerKey) != outer->second.end();
    }
};
