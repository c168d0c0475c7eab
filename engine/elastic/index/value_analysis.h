#pragma once

#include <string>
#include <vector>

#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_settings.h"

namespace vantrel::elastic {

// The terms that a value becomes in a field of this type, as the index would hold them. The value has passed
// DocumentBuilder::CheckValue.
std::vector<AnalyzedToken> AnalyzeValue(FieldType type, const std::wstring& value);

}  // namespace vantrel::elastic
