#include "suggest/pre_proc_factories.h"

#include "vantrel/elastic/ngram_pre_proc.h"
#include "vantrel/elastic/to_lower_pre_proc.h"

using vantrel::elastic::NgramPreProc;
using vantrel::elastic::PreProcFactoryT;
using vantrel::elastic::ToLowerPreProc;

const std::map<std::string, std::shared_ptr<vantrel::elastic::FieldPreProc> (*)(
                                std::shared_ptr<vantrel::elastic::FieldPreProc>, const std::string&)>
    PreProcFactoryMap = {
        {"tolower", PreProcFactoryT<ToLowerPreProc>},
        {"ngram", PreProcFactoryT<NgramPreProc>},
};
