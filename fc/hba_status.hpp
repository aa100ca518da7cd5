// The names of HBA API status codes (FC-HBA, HBA_STATUS).
#pragma once

#include "fc/hba_api.hpp"

// The constant name of a status, or "Invalid Hbaapi Status Code" for one above 30.
const char* hbaStatusName(HBA_STATUS status);
