// The SNIA HBA API's header, which takes time_t for granted.
#pragma once

#include <ctime>
// the order matters
#include <hbaapi.h>
