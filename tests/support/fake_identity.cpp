#include "tests/support/fake_identity.hpp"

#include <cstdlib>

#include "fc/identity/unique_lun_id.hpp"

bool gDirectAttachedFlag = false;

namespace {

FakeIdentity* gIdentity = nullptr;

} // namespace

FakeIdentity::FakeIdentity() {
    gIdentity = this;
}

FakeIdentity::~FakeIdentity() {
    gIdentity = nullptr;
}

void FakeIdentity::askVendor(const std::string& name) {
    mQuestions.push_back("vendor " + name);
    const auto answer = mVendorData.find(name);
    if (answer != mVendorData.end()) {
        static_cast<void>(answer->second());
    }
}

std::string FakeIdentity::askIdentifier(const std::string& name, unsigned requestFlag) {
    mQuestions.push_back("identifier " + name + " " + std::to_string(requestFlag));
    const auto answer = mIdentifiers.find(name);
    if (answer == mIdentifiers.end()) {
        throw NotFoundEx("Cannot open device for Scsi Inquiry\n");
    }
    return answer->second();
}

void HA_GetScsiUniqueLunId(const ZebString& deviceName, ZebString& identifier, uint32& requestFlag) {
    if (gIdentity == nullptr) {
        std::abort();
    }
    identifier = gIdentity->askIdentifier(deviceName.c_str(), requestFlag).c_str();
}

void HA_PrintVendorProductId(const ZebString& deviceName) {
    if (gIdentity == nullptr) {
        std::abort();
    }
    gIdentity->askVendor(deviceName.c_str());
}
