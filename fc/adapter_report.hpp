// The report of one adapter's tree: adapter, initiator ports, targets and LUNs.
#pragma once

#include <cstdio>

#include "fc/hba_access.hpp"

// Writes the tree to `stream`: under every port all entries of the adapter's `mapping`, which belongs to the
// adapter and not to a port. Throws WriteFailedEx "File write failed".
void HA_PrintAdapterTree(const HBA_ADAPTERATTRIBUTES& adapter, const PortAttributes& ports,
                         const HBA_FCPTARGETMAPPINGV2& mapping, std::FILE* stream);
