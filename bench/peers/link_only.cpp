// Links what the tool links, and does nothing: what a run costs before the tool's first instruction.

#include <json/value.h>
#include <lucene++/LuceneHeaders.h>

#include "vantrel/elastic/index_info.h"

int main(int argc, char**) {
  // Never so; but it needs a symbol of each library, so that the linker keeps them.
  if (argc == 0) {
    const Json::Value value(vantrel::elastic::IndexInfo("").GetSegmentNum());
    return Lucene::StringUtils::toUnicode(value.asString()).empty() ? 1 : 2;
  }
  return 0;
}
