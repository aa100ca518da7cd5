#include "main/shared/iscsi_model.hpp"

IscsiPorts::List gIscsiPortList;
