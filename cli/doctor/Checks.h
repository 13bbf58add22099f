// Checks.h: what the doctor looks at. Each check adds what it found, changes nothing, and never ends in a Failure of its
// own: what cannot be looked at is a problem too. No text holds a secret.
#pragma once

#include <map>
#include <vector>

#include "AccountStore.h"
#include "doctor/Finding.h"

namespace doctor {

// The device.
void checkFolders(std::vector<Finding>* all);
void checkKeys(std::vector<Finding>* all);
void checkDisk(std::vector<Finding>* all);
void checkStores(std::vector<Finding>* all);
void checkSettings(std::vector<Finding>* all);
void checkDaemon(std::vector<Finding>* all);

// The accounts, and the servers that they name.
void checkAccounts(std::vector<Finding>* all);
void checkTokens(std::vector<Finding>* all);
void checkSyncs(std::vector<Finding>* all);
void checkServers(std::vector<Finding>* all);

}  // namespace doctor
