#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "core/Element.h"
#include "core/KXMLReader.h"
#include "core/KXMLWriter.h"
#include "kernel/KException.h"

// Any text either fails to read with a KException or yields a tree that the writer accepts and
// that reads back equal, in both layouts, and writes again to the same bytes. Anything else
// (a crash, another exception, a sanitizer report, a differing round trip) is a finding.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Element tree;
  try {
    tree = KXMLReader::Read(std::string_view(reinterpret_cast<const char*>(data), size));
  } catch (const KException&) {
    return 0;
  }
  for (const auto layout : {KXMLWriter::kIndented, KXMLWriter::kCompact}) {
    const std::string text = KXMLWriter::Write(tree, "utf-8", layout);
    const Element again = KXMLReader::Read(text);
    if (!(again == tree) || KXMLWriter::Write(again, "utf-8", layout) != text) std::abort();
  }
  return 0;
}
