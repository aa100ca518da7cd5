#include "main/shared/run_state.hpp"

char* gHostName = nullptr;
ZebSensorLinuxPowerPathHandler gPowerPath;
