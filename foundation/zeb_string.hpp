// The system's string: a value with deep copies, ordered byte by byte, that is never used without a text.
#pragma once

#include <string>

#include "foundation/counted_pointer.hpp"

// A default-constructed ZebString holds no text at all, and every operation on it but assignment to it is
// fatal; an empty text is ZebString("").
class ZebString {
public:
    using size_type = std::string::size_type;
    static constexpr size_type npos = std::string::npos;

    ZebString() = default;
    // A copy of the NUL-terminated text. Throws NoMemoryEx "No Memory\n" and std::bad_alloc.
    ZebString(const char* acpString); // NOLINT(google-explicit-constructor): texts are strings everywhere
    ZebString(const ZebString& acrCopy);
    ZebString& operator=(const ZebString& acrCopy);
    ~ZebString() = default;

    bool operator==(const char* acpString) const;
    bool operator==(const ZebString& acrString) const;
    bool operator!=(const ZebString& acrString) const;
    bool operator<(const ZebString& acrString) const; // the key order of every map

    ZebString& operator+=(const ZebString& acrString);
    ZebString& operator+=(const char* acpString);

    const char* c_str() const; // owned by this string, valid until it changes
    size_type size() const;
    bool empty() const;
    void clear();

    // As std::string's; npos when absent.
    size_type find(const char* acpText, size_type acPosition = 0) const;
    size_type find_first_of(char acCharacter, size_type acPosition = 0) const;
    size_type find_last_not_of(const char* acpSet) const;

    // The text from `pos` on, at most `n` bytes. Fatal when the position is behind the end.
    ZebString substr(size_type pos, size_type n) const;

private:
    void take(std::string* apText); // becomes the owner of a text made by a non-throwing new

    ZebCountedPointer<std::string> mString;
};
