#pragma once

#include <string>
#include <vector>

namespace vantrel::elastic {

// One value of a field, in UTF-8.
struct DocumentField {
  std::string name;
  std::string value;
};

// What is added to an index: values in an order that stored values keep. A field may occur several times, or
// not at all.
struct Document {
  std::vector<DocumentField> fields;
};

}  // namespace vantrel::elastic
