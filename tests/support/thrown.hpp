// What an action throws.
#pragma once

#include <exception>
#include <string>
#include <typeinfo>

#include <gtest/gtest.h>

// The text of the exception that `action` throws. It must be an `Exception` and no subclass of it.
template <typename Exception, typename Action>
std::string messageOf(const Action& action) {
    try {
        action();
    } catch (const std::exception& exception) {
        EXPECT_STREQ(typeid(exception).name(), typeid(Exception).name());
        return exception.what();
    }
    ADD_FAILURE() << "nothing thrown";
    return {};
}
