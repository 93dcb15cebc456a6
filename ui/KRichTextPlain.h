#pragma once

#include <string>

#include "kernel/KExport.h"
#include "ui/KRichTextDocument.h"

// A document as plain UTF-8 text for a terminal: a line per paragraph (line breaks kept), list
// items bulleted and indented, table cells separated by " | ", images by their icon name in
// brackets, horizontal lines as dashes.
TORVANE_API std::string KRichTextPlainText(const KRichTextDocument& document);
