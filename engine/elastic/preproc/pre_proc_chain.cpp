#include "elastic/preproc/pre_proc_chain.h"

#include <algorithm>
#include <array>
#include <numeric>
#include <stdexcept>
#include <string>
#include <utility>

#include "elastic/common/quoted.h"
#include "vantrel/elastic/ngram_pre_proc.h"
#include "vantrel/elastic/to_lower_pre_proc.h"

namespace vantrel::elastic {
namespace {

constexpr size_t kMostSteps = 8;
constexpr uint64_t kEndlessGrowth = uint64_t{1} << 32;

constexpr const char* kToLower = "tolower";
constexpr const char* kNgram = "ngram";

struct NamedFactory {
  const char* name;
  std::shared_ptr<FieldPreProc> (*make)(std::shared_ptr<FieldPreProc> previous, const std::string& argument);
};

constexpr std::array kFactories = {NamedFactory{kToLower, PreProcFactoryT<ToLowerPreProc>},
                                   NamedFactory{kNgram, PreProcFactoryT<NgramPreProc>}};

bool HasStep(const std::vector<PreProcSettings>& settings, const char* name) {
  return std::any_of(settings.begin(), settings.end(),
                     [&](const PreProcSettings& step) { return step.name == name; });
}

}  // namespace

std::shared_ptr<const FieldPreProc> BuildPreProcChain(const std::vector<PreProcSettings>& settings) {
  if (settings.size() > kMostSteps) {
    throw std::invalid_argument(std::to_string(settings.size()) + " pre-processors are more than " +
                                std::to_string(kMostSteps));
  }
  std::shared_ptr<FieldPreProc> chain;
  for (const PreProcSettings& step : settings) {
    const auto factory = std::find_if(kFactories.begin(), kFactories.end(),
                                      [&](const NamedFactory& known) { return step.name == known.name; });
    if (factory == kFactories.end()) {
      throw std::invalid_argument("there is no pre-processor " + Quoted(step.name));
    }
    chain = factory->make(std::move(chain), step.argument);
  }
  return chain;
}

bool LowersCase(const std::vector<PreProcSettings>& settings) { return HasStep(settings, kToLower); }

bool MakesPhrases(const std::vector<PreProcSettings>& settings) { return HasStep(settings, kNgram); }

uint64_t MostGrowth(const std::vector<PreProcSettings>& settings) {
  uint64_t growth = 1;
  for (const PreProcSettings& step : settings) {
    if (step.name != kNgram) continue;
    const std::vector<uint32_t> lengths = NgramPreProc::GramLengths(step.argument);
    growth = std::min(growth * std::accumulate(lengths.begin(), lengths.end(), uint64_t{0}), kEndlessGrowth);
  }
  return growth;
}

}  // namespace vantrel::elastic
