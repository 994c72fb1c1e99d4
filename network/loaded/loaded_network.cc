#include "network/loaded/loaded_network.h"

namespace qz {

extern "C" {
alignas(16) unsigned char loaded_tables[kLoadedTableBytes];
}

}  // namespace qz
