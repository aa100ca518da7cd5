// Writes the described adapters in the form of adapter_file.hpp.
#pragma once

#include "simhost/description.hpp"

namespace simhost {

// The whole content of the adapter file.
Bytes adapterFile(const VendorLibrary& library, const std::vector<Adapter>& adapters);

} // namespace simhost
