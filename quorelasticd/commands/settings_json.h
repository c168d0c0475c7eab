#pragma once

#include <json/value.h>

#include "commands/shape.h"
#include "vantrel/elastic/index_settings.h"

namespace quorelasticd {

// The settings of an index as the protocol has them.
Shape SettingsShape();

// `json` is of the shape above. Defaults stand in for members left out.
vantrel::elastic::IndexSettings ToSettings(const Json::Value& json);

Json::Value ToJson(const vantrel::elastic::IndexSettings& settings);

}  // namespace quorelasticd
