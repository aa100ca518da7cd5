// The work lists: an empty list and a failed allocation become exceptions.
#pragma once

#include <list>
#include <new>

#include "foundation/exceptions.hpp"

template <typename Element>
struct ZebList {
    using List = std::list<Element>;

    // Appends a copy. Throws NoMemoryEx "No Memory\n".
    static void push_back(List& list, const Element& element) {
        try {
            list.push_back(element);
        } catch (const std::bad_alloc&) {
            throw NoMemoryEx("No Memory\n");
        }
    }

    // The first element, owned by the list. Throws NotFoundEx "Element not found\n" on an empty list.
    static Element& front(List& list) {
        if (list.empty()) {
            throw NotFoundEx("Element not found\n");
        }
        return list.front();
    }

    // Removes the first element. Throws NotFoundEx "Element Not Found\n" on an empty list.
    static void pop_front(List& list) {
        if (list.empty()) {
            throw NotFoundEx("Element Not Found\n");
        }
        list.pop_front();
    }
};
