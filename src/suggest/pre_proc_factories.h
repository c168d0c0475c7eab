#pragma once

#include <map>
#include <memory>
#include <string>

#include "vantrel/elastic/field_pre_proc.h"

// What makes each pre-processor, by its name: wraps the one before it, and hands over its argument.
extern const std::map<std::string, std::shared_ptr<vantrel::elastic::FieldPreProc> (*)(
                                       std::shared_ptr<vantrel::elastic::FieldPreProc>, const std::string&)>
    PreProcFactoryMap;
