#include "main/run_state.hpp"

char* gHostName = nullptr;
bool gDirectAttachedFlag = false;
ZebSensorLinuxPowerPathHandler gPowerPath;
