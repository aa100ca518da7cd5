#include "foundation/zeb_string.hpp"

#include <cstring>
#include <new>
#include <stdexcept>

#include "foundation/assertion.hpp"
#include "foundation/exceptions.hpp"

// The assertions spell null pointers as the log shows them.
// NOLINTBEGIN(modernize-use-nullptr)

ZebString::ZebString(const char* acpString) {
    take(new (std::nothrow) std::string(acpString));
}

ZebString::ZebString(const ZebString& acrCopy) {
    ASSERT_OR_EXIT(acrCopy.mString != 0);
    take(new (std::nothrow) std::string(*acrCopy.mString));
}

ZebString& ZebString::operator=(const ZebString& acrCopy) {
    if (this != &acrCopy) {
        // NOLINTNEXTLINE(readability-redundant-smartptr-get): get asserts less than the operator
        take(new (std::nothrow) std::string(*acrCopy.mString.get()));
    }
    return *this;
}

void ZebString::take(std::string* apText) {
    ZebCountedPointer<std::string> text;
    text.create(apText, ZebPST_Individual, ZebPAT_New);
    mString = text;
}

bool ZebString::operator==(const char* acpString) const {
    ASSERT_OR_EXIT(mString != 0);
    ASSERT_OR_EXIT(0 != acpString);
    return std::strcmp(mString->c_str(), acpString) == 0;
}

bool ZebString::operator==(const ZebString& acrString) const {
    ASSERT_OR_EXIT(mString != 0);
    ASSERT_OR_EXIT(acrString.mString != 0);
    return std::strcmp(mString->c_str(), acrString.mString->c_str()) == 0;
}

bool ZebString::operator!=(const ZebString& acrString) const {
    ASSERT_OR_EXIT(mString != 0);
    return std::strcmp(mString->c_str(), acrString.c_str()) != 0;
}

bool ZebString::operator<(const ZebString& acrString) const {
    ASSERT_OR_EXIT(mString != 0);
    return mString->compare(*acrString.mString) < 0;
}

ZebString& ZebString::operator+=(const ZebString& acrString) {
    ASSERT_OR_EXIT(mString != 0);
    ASSERT_OR_EXIT(acrString.mString != 0);
    mString->append(*acrString.mString);
    return *this;
}

ZebString& ZebString::operator+=(const char* acpString) {
    ASSERT_OR_EXIT(mString != 0);
    ASSERT_OR_EXIT(acpString != 0);
    mString->append(acpString);
    return *this;
}

const char* ZebString::c_str() const {
    ASSERT_OR_EXIT(mString != 0);
    return mString->c_str();
}

ZebString::size_type ZebString::size() const {
    ASSERT_OR_EXIT(mString != 0);
    return mString->size();
}

bool ZebString::empty() const {
    ASSERT_OR_EXIT(mString != 0);
    return mString->empty();
}

void ZebString::clear() {
    ASSERT_OR_EXIT(mString != 0);
    mString->clear();
}

ZebString::size_type ZebString::find(const char* acpText, size_type acPosition) const {
    ASSERT_OR_EXIT(mString != 0);
    return mString->find(acpText, acPosition);
}

ZebString::size_type ZebString::find_first_of(char acCharacter, size_type acPosition) const {
    ASSERT_OR_EXIT(mString != 0);
    return mString->find_first_of(acCharacter, acPosition);
}

ZebString::size_type ZebString::find_last_not_of(const char* acpSet) const {
    ASSERT_OR_EXIT(mString != 0);
    return mString->find_last_not_of(acpSet, npos);
}

ZebString ZebString::substr(size_type pos, size_type n) const {
    ASSERT_OR_EXIT(mString != 0);
    ASSERT_OR_EXIT(pos <= mString->size());
    try {
        ZebString result;
        result.take(new (std::nothrow) std::string(mString->substr(pos, n)));
        return result;
    } catch (const std::out_of_range&) {
        throw InvalidEx("Invalid\n");
    }
}

// NOLINTEND(modernize-use-nullptr)
