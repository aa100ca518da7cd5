// World wide names.
#pragma once

#include "fc/hba_api.hpp"

// The text of a WWN: eight bytes in order, as two lower-case hex digits each, with ':' between them.
struct WwnText {
    explicit WwnText(const HBA_WWN& wwn);
    char text[25] = {};
};

bool isSameWwn(const HBA_WWN& a, const HBA_WWN& b);
