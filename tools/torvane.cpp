// The command-line host: lists the kernel's plug-ins and creates each one through the same
// exported entry points that every host uses.
#include <cstdio>
#include <memory>

#include "core/KAudioPlugin.h"
#include "kernel/KEntryPoints.h"

int main() {
  const KStringList& keys = GetTorvanePluginList();
  std::printf("%d plug-ins registered\n", keys.Count());
  int failures = 0;
  for (const KString& key : keys) {
    std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(key));
    std::printf("%-32s %s\n", key.ToUtf8().c_str(), plugin ? "created" : "FAILED");
    if (!plugin) ++failures;
  }
  return failures == 0 ? 0 : 1;
}
