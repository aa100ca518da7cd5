#include "main/iscsi_model.hpp"

ZebList<ZebCountedPointer<IscsiInitiatorPort>>::List gIscsiPortList;
ZebStringMap<ZebCountedPointer<IscsiInitiatorPort>>::Map gIscsiPortMap;
