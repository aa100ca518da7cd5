// The Fibre Channel discovery pass: every adapter, its ports and its target mapping, each LUN identified.
#pragma once

#include <sys/time.h>

#include <memory>
#include <string>

#include "fc/hba_access.hpp"

// Loads the HBA API library, builds every adapter's tree, prints it into the log and keeps its records.
// Throws THaltEx when there are no adapters; THbaapiEx when the library cannot be loaded or an adapter has no
// name; and WriteFailedEx for an adapter name that cannot be formatted. Any failure of one adapter costs that
// adapter.
void sFirstBuildAndOutput();

// Releases every adapter's records, closes the adapters and unloads the library.
void cleanUpFcTree();

// The steps of the pass, from the outside in.
void sBuildAndOutput();
void sBuildAdapterTreeAndOutput(HBA_HANDLE handle);
// These three hand out what they keep until the clean-up.
// The stored record, or null for an adapter that is not supported.
const HBA_ADAPTERATTRIBUTES* sBuildAdapterAttributes(HBA_HANDLE handle);
const PortAttributes& sBuildPortAttributes(HBA_HANDLE handle, const HBA_ADAPTERATTRIBUTES& adapter);
// The built mapping: the source entry i is in slot i, unless it was left out, and the count is that of the
// entries that were not. Throws NoMemoryEx, and what HA_GetScsiUniqueLunId throws except NotFoundEx and
// NotSupportedEx.
const HBA_FCPTARGETMAPPINGV2& sBuildTargetMappings(HBA_HANDLE handle);

// Milliseconds from `start` to `end`; logs both.
double elapsedMilliseconds(const timeval& start, const timeval& end);

// The adapter name as printf would expand it, were it a format without arguments: "%%" is '%', and every
// other conversion stays as it stands. Throws WriteFailedEx "String Write failed\n" for a name that ends in a
// lone '%'.
std::string expandAdapterName(const char* name);
