#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_settings.h"

namespace vantrel::elastic {

// The terms that a value becomes in a field, as the index would hold them. The value has passed
// DocumentBuilder::CheckValue for this field.
std::vector<AnalyzedToken> AnalyzeValue(const IndexSettings& settings, std::string_view field,
                                        const std::wstring& value);

}  // namespace vantrel::elastic
