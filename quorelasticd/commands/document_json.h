#pragma once

#include <json/value.h>

#include <string>

#include "vantrel/elastic/document.h"

namespace quorelasticd {

// A document as the protocol has it: an object of fields, each a string or an array of strings. Throws RequestError
// (bad_request) where it is none. Whether the index takes its fields and values is the engine's to say.
vantrel::elastic::Document ToDocument(const Json::Value& json);

}  // namespace quorelasticd
