// What the log says while a device is asked for its unique identifier, '#' standing for the numbers of trace
// lines and for addresses.
#pragma once

#include <string>

#include "tests/support/inquiry_fixture.hpp"

// The text without the addresses of the two buffer objects.
inline std::string withoutAddresses(std::string text) {
    for (const std::string label : {"Vpd Page: ", "InqBuffer "}) {
        for (auto at = text.find(label); at != std::string::npos; at = text.find(label, at + 1)) {
            const auto address = at + label.size();
            text.replace(address, text.find_first_of(" \n", address) - address, "#");
        }
    }
    return text;
}

// The question for the device type, and its answer's check.
inline std::string askedForType() {
    return traced("isDeviceTypeSupported",
                  didStandardInquiry() + traced("validateResponse", tookReadPointer()) + tookReadPointer());
}

// From the node's opening to the page's reading, for a disk.
inline std::string openedDisk() {
    return traced("open") + askedForType() + "Get LunID\n";
}

// The page's reading, which ends well.
inline std::string readPage(const Bytes& page) {
    const auto length = static_cast<uint32>(page.size());
    return traced("getDeviceIdentificationVpd",
                  madeContext() + "lcAllocLength = 4\n" + carriedOut(inquiryCdb(1, 0x83, 4)) +
                      "Determining the length of Identification descriptor list\n"
                      "Going to dump the DI VPD page heder\n" +
                      tookReadPointer() + dumped(Bytes(page.begin(), page.begin() + 4)) +
                      "Identification descriptor list length is: " + std::to_string(length - 4) +
                      " bytes\nSending Inquiry again with alloc length: " + std::to_string(length) +
                      " bytes\n" + carriedOutAgain(inquiryCdb(1, 0x83, length)) +
                      "Going to dump entire DI VPD page\n" + tookReadPointer() + dumped(page) +
                      tookReadPointer() + "Peripheral type from vpd page = 0\n") +
           freedContext() + "Vpd Page: #\n";
}

// The page's reading, of which the first command fails with what `failure` says.
inline std::string readPageInVain(const std::string& failure) {
    return entered("getDeviceIdentificationVpd") + madeContext() + "lcAllocLength = 4\n" +
           createdCdb(inquiryCdb(1, 0x83, 4)) + failure + freedContext() + freedBuffer();
}

// One step of the walk, to the descriptor at `offset`, whose identifier shows as `text`.
inline std::string walkedTo(std::size_t offset, const Bytes& descriptor, const std::string& text) {
    static const char* const kDigits = "0123456789abcdef";
    const std::string type(1, kDigits[descriptor[1] % 16]);
    const std::string association(1, kDigits[descriptor[1] / 16 % 4]);
    return traced("getDiPageIdentifierAscii",
                  tookReadPointer() + "Going to Extract Data from Descriptor @ " + std::to_string(offset) +
                      "\n" + dumped(descriptor) + "Going to store identifier in " +
                      (descriptor[0] % 16 == kBinaryCodeSet ? "Binary" : "ASCII") + " format\nID Type: 0" +
                      type + "; Association type: 0" + association + "; Identifier: '" + text + "'\n");
}

// The last step, behind the last descriptor.
inline std::string walkedToEnd() {
    return traced("getDiPageIdentifierAscii",
                  tookReadPointer() + "No more descriptors left in DI page to read\n") +
           "No LUN-association Descriptor found\n";
}

// The only step on a page that holds no descriptor where the first should be.
inline std::string walkedMalformed() {
    return traced("getDiPageIdentifierAscii",
                  tookReadPointer() + "Device Identification Data is malformed\n") +
           "Malformed VPD 0x83 Page\n";
}

inline std::string gotField(int field) {
    return traced("sGetStdInqField",
                  traced("getInquiryFieldAscii", tookReadPointer() +
                                                     "Peripheral type from standard enquiry = 0\n"
                                                     "Going to extract Inquiry data for field type: " +
                                                     std::to_string(field) + "\n"));
}

// The last lines of a successful call.
inline std::string gotIdentifier() {
    return traced("close") + "Got ULID\n" + left("HA_GetScsiUniqueLunId");
}
