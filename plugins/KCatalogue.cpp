#include "kernel/KCatalogue.h"

// The order of this table is the order hosts and the command line list the plug-ins in: add
// new plug-ins at the end.
const KCatalogue& KProductCatalogue() {
  static const KCatalogue catalogue{{}, {}};
  return catalogue;
}
