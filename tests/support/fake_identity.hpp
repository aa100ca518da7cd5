// Devices that answer the questions for their vendor and unique LUN identifier as a test says, in place of
// the functions that read them from a device. These write nothing to the log.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "foundation/exceptions.hpp"

// Throws for a device that cannot be asked.
using FakeAnswer = std::function<std::string()>;

class FakeIdentity {
public:
    FakeIdentity();
    FakeIdentity(const FakeIdentity&) = delete;
    FakeIdentity& operator=(const FakeIdentity&) = delete;
    ~FakeIdentity();

    // The answer of device `name`; a device without one cannot be opened.
    void identifier(const std::string& name, FakeAnswer answer) { mIdentifiers[name] = std::move(answer); }
    void identifier(const std::string& name, const std::string& text) {
        identifier(name, [text] { return text; });
    }
    // The vendor data of every device: nothing, unless `answer` throws.
    void vendorData(const std::string& name, FakeAnswer answer) { mVendorData[name] = std::move(answer); }

    const std::vector<std::string>& questions() const { return mQuestions; }

    void askVendor(const std::string& name);
    std::string askIdentifier(const std::string& name, unsigned requestFlag);

private:
    std::map<std::string, FakeAnswer> mIdentifiers;
    std::map<std::string, FakeAnswer> mVendorData;
    std::vector<std::string> mQuestions; // such as "vendor /dev/sda" and "identifier /dev/sda 1"
};

// The answer of a device that throws.
template <typename Exception>
FakeAnswer throws(const char* message = "device\n") {
    return [message]() -> std::string { throw Exception(message); };
}
