#include "foundation/exceptions.hpp"

#include <exception>
#include <type_traits>
#include <typeinfo>

#include <gtest/gtest.h>

namespace {

template <typename Exception>
class ExceptionClass : public testing::Test {};

using Classes =
    testing::Types<NoMemoryEx, TryAgainEx, OpenFailedEx, CloseFailedEx, CreateFailedEx, ReadFailedEx,
                   WriteFailedEx, ExistsEx, ClibChdirFailedEx, ClibChmodFailedEx, ClibGetTimeFailedEx,
                   ClibDupFailedEx, ClibDup2FailedEx, ClibPwdFailedEx, ClibSleepFailedEx, ClibPutenvFailedEx,
                   ClibRmdirFailedEx, ClibStatFailedEx, ClibUtimeFailedEx, ClibGetProcStatusFailedEx,
                   ClibUnlinkFailedEx, ClibMkdirFailedEx, THaltEx, THbaapiEx, NotSupportedEx, NotFoundEx,
                   InvalidEx, ExpiredEx, ZebNotFoundEx>;

TYPED_TEST_SUITE(ExceptionClass, Classes);

TYPED_TEST(ExceptionClass, KeepsItsTextWithTheLineEnd) {
    EXPECT_STREQ(TypeParam("No Memory\n").what(), "No Memory\n");
}

TYPED_TEST(ExceptionClass, KeepsItsTextWithoutALineEnd) {
    EXPECT_STREQ(TypeParam("File read failed").what(), "File read failed");
}

TYPED_TEST(ExceptionClass, OwnsACopyOfItsText) {
    char text[] = "text";
    const TypeParam exception(text);
    text[0] = 'n';
    EXPECT_STREQ(exception.what(), "text");
}

TYPED_TEST(ExceptionClass, IsCaughtAsTException) {
    try {
        throw TypeParam("text\n");
    } catch (TException& exception) {
        EXPECT_EQ(typeid(exception), typeid(TypeParam));
        EXPECT_STREQ(exception.what(), "text\n");
    }
}

TYPED_TEST(ExceptionClass, IsCaughtAsStandardException) {
    try {
        throw TypeParam("text\n");
    } catch (const std::exception& exception) {
        EXPECT_EQ(typeid(exception), typeid(TypeParam));
        EXPECT_STREQ(exception.what(), "text\n");
    }
}

TYPED_TEST(ExceptionClass, AddsNothingToTheRoot) {
    EXPECT_TRUE((std::is_base_of_v<TException, TypeParam>));
    EXPECT_EQ(sizeof(TypeParam), sizeof(TException));
}

TEST(TException, IsAStandardException) {
    EXPECT_TRUE((std::is_base_of_v<std::exception, TException>));
}

TEST(TException, SurvivesAnEmptyText) {
    EXPECT_STREQ(TException("").what(), "");
}

} // namespace
