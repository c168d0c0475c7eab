// Damages small indexes of every kind, one file at a time, and runs each offline action of the real program on what is
// left, with 2 GiB of memory and ten seconds: it must end by itself, or by an exception that it did not catch. The
// same for what a daemon does with an index, where no exception but the engine's own may come.

#include <gmock/gmock.h>
#include <lucene++/LuceneHeaders.h>
#include <sys/wait.h>

#include <algorithm>
#include <array>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <random>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "damage/damage.h"
#include "damage/limited_run.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/io/folder.h"
#include "elastic/manifest/manifest.h"
#include "engine/check/health_shapes.h"
#include "support/files.h"
#include "support/run_size.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/library_setup.h"

namespace quorelastic::testing {
namespace {

using ::testing::AllOf;
using ::testing::AnyOf;
using ::testing::HasSubstr;
using ::testing::Not;

constexpr uint32_t kSeed = 20251122;

struct Action {
  const char* word;
  bool catches;  // exceptions: then it never aborts
};

constexpr std::array kActions = {
    Action{"allterm", false}, Action{"term", false},   Action{"position", true},    Action{"doc_term", true},
    Action{"check", false},   Action{"repair", false}, Action{"term_suggest", true}};

// Whether a run is not of another action alone.
bool IsWanted(const Action& action) {
  const char* only = std::getenv("QUORELASTIC_TOOL_ACTION");
  if (only == nullptr) return true;
  if (std::none_of(kActions.begin(), kActions.end(),
                   [&](const auto& known) { return known.word == std::string(only); })) {
    throw std::runtime_error("QUORELASTIC_TOOL_ACTION: there is no action " + std::string(only));
  }
  return action.word == std::string(only);
}

// What there is to look up in an index.
struct Contents {
  std::vector<std::pair<std::string, std::string>> terms;  // field, text
  std::vector<std::string> fields;
  int32_t documents = 0;
};

Contents Explore(const std::string& path) {
  using Lucene::StringUtils;
  const auto reader =
      Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(path)), true);
  Contents contents;
  contents.documents = reader->maxDoc();
  const Lucene::TermEnumPtr cursor = reader->terms();
  while (cursor->next()) {
    const Lucene::TermPtr term = cursor->term();
    contents.terms.emplace_back(StringUtils::toUTF8(term->field()), StringUtils::toUTF8(term->text()));
  }
  for (const auto& field : reader->getFieldNames(Lucene::IndexReader::FIELD_OPTION_ALL)) {
    contents.fields.push_back(StringUtils::toUTF8(field));
  }
  std::sort(contents.fields.begin(), contents.fields.end());
  return contents;
}

// How the runs ended.
struct Tally {
  int runs = 0;
  int alike = 0;      // as on the intact index
  int different = 0;  // with another answer
  int reported = 0;   // with the report of an exception
  int aborted = 0;    // by one
};

bool IsReport(const std::string& output) {
  return output.find("LuceneException: ") != std::string::npos ||
         output.find("Exception:") != std::string::npos;
}

class ReliabilityDamage : public ::testing::TestWithParam<HealthShape> {
 protected:
  void SetUp() override {
    vantrel::elastic::PrepareIndexLibrary();
    const HealthShape& shape = GetParam();
    if (shape.older_layout == nullptr) {
      WriteVariedIndex(index_, shape.index);
    } else {
      const std::string command = std::string(CLUCENE_WRITER) + " '" + index_ + "' " + shape.older_layout;
      const int status = std::system(command.c_str());
      ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << command;
    }
    contents_ = Explore(index_);
    random_.seed(kSeed + shape.index.seed);
    for (std::vector<std::string>& lookup : lookups_) lookup = RandomLookup();
  }

  size_t Below(size_t bound) { return random_() % bound; }

  // The options of one lookup; "position" looks for a term that is there, near a document that mostly is.
  std::vector<std::string> RandomLookup() {
    const auto& [field, text] = contents_.terms[Below(contents_.terms.size())];
    const std::string document = std::to_string(Below(static_cast<size_t>(contents_.documents) + 2));
    const std::string& vector_field =
        Below(4) == 0 ? contents_.fields[Below(contents_.fields.size())] : "body";
    return {"-f", field, "-t", text, "-n", document, "-f", vector_field};
  }

  LimitedRun Run(const Action& action, const std::string& path,
                 const std::vector<std::string>& options) const {
    const std::string word = action.word;
    std::vector<std::string> arguments = {"-a", word, "-d", path, "-i"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    // The last --field counts, which is the one for vectors.
    if (word != "doc_term") arguments.resize(arguments.size() - 2);
    if (word == "allterm" || word == "term") arguments.insert(arguments.end(), {"-f", ""});
    return RunToolLimited(arguments);
  }

  // What changes the folder gets one of its own. No file is ever written in place.
  void MakeCopy() const {
    std::filesystem::remove_all(copy_);
    using Options = std::filesystem::copy_options;
    std::filesystem::copy(index_, copy_, Options::create_hard_links | Options::recursive);
  }

  LimitedRun RunOnCopy(const Action& action, const std::vector<std::string>& options) const {
    MakeCopy();
    return Run(action, copy_, options);
  }

  // Makes the index one that the engine can search and write: with settings for its fields.
  void WriteSettings() const {
    std::string fields;
    for (const std::string& field : contents_.fields) {
      fields += R"({"name":")" + field +
                R"(","type":"text","stored":true,"term_vector":"none","norms":true,"frequencies":true},)";
    }
    WriteFile(index_ + "/quorelastic.json",
              R"({"version":1,"compound_files":true,"id_field":"own_id","fields":[)" + fields +
                  R"({"name":"own_id","type":"keyword","stored":true,"term_vector":"none","norms":false,)" +
                  R"("frequencies":false}]})");
  }

  std::string ManifestOfIndex() const {
    const vantrel::elastic::format::DiskFolder folder(index_);
    return WriteManifest(MakeManifest(folder, ReadNewestCommit(folder)));
  }

  LimitedRun UseCopy(const std::pair<std::string, std::string>& term) const {
    return RunLimited(USE_INDEX, {copy_, term.first, term.second});
  }

  LimitedRun RunAny(const Action& action, const std::vector<std::string>& options) const {
    return action.word == std::string("repair") ? RunOnCopy(action, options) : Run(action, index_, options);
  }

  // What an action says of the intact index.
  const LimitedRun& Intact(const Action& action, size_t lookup) {
    LimitedRun& run = intact_[{action.word, lookup}];
    if (run.output.empty() && run.errors.empty()) run = RunAny(action, lookups_[lookup]);
    return run;
  }

  void Judge(const Action& action, const LimitedRun& run, const LimitedRun& intact) {
    ++tally_.runs;
    const std::string said = run.output + run.errors;
    EXPECT_THAT(said, Not(AnyOf(HasSubstr("bad_alloc"), HasSubstr("memory"))));
    if (WIFEXITED(run.status)) {
      EXPECT_EQ(WEXITSTATUS(run.status), 0) << said;
      if (action.catches && IsReport(run.output)) {
        ++tally_.reported;
      } else {
        ++(said == intact.output + intact.errors ? tally_.alike : tally_.different);
      }
      return;
    }
    ++tally_.aborted;
    EXPECT_FALSE(action.catches) << said;
    EXPECT_EQ(WTERMSIG(run.status), SIGABRT) << said;
    EXPECT_THAT(run.errors, HasSubstr("terminate called after throwing"));
  }

  void TellTally(int damages) const {
    const auto number = [](int n) { return std::to_string(n); };
    Tell("damage", std::string(GetParam().name) + ": " + number(damages) + " damages, " +
                       number(tally_.runs) + " runs: " + number(tally_.alike) + " as on the intact index, " +
                       number(tally_.different) + " otherwise, " + number(tally_.reported) +
                       " reported an exception, " + number(tally_.aborted) + " aborted by one");
  }

  TemporaryFolder folder_;
  const std::string index_ = folder_ / "index";
  const std::string copy_ = folder_ / "copy";
  Contents contents_;
  std::mt19937 random_;
  std::array<std::vector<std::string>, 24> lookups_;
  std::map<std::pair<std::string, size_t>, LimitedRun> intact_;
  Tally tally_;
};

INSTANTIATE_TEST_SUITE_P(, ReliabilityDamage, ::testing::ValuesIn(HealthShapes()),
                         [](const auto& test) { return test.param.name; });

TEST_P(ReliabilityDamage, EveryOfflineActionEndsByItselfOrByAnUncaughtException) {
  const int damages = RunSize("QUORELASTIC_TOOL_DAMAGES", 24) / kFewer;
  for (int i = 0; i < damages; ++i) {
    const std::vector<std::string> files = ListFolder(index_);
    const Damage damage = RandomDamageTo(index_, files[Below(files.size())], random_);
    const size_t lookup = Below(lookups_.size());
    for (const Action& action : kActions) {
      if (!IsWanted(action)) continue;
      const LimitedRun& intact = Intact(action, lookup);
      const DamagedFile damaged(index_, damage);
      SCOPED_TRACE("damage " + std::to_string(i) + ", " + action.word + " " +
                   ::testing::PrintToString(lookups_[lookup]) + ": " + damage.Describe());
      Judge(action, RunAny(action, lookups_[lookup]), intact);
    }
    if (HasFailure()) break;
  }
  TellTally(damages);
  EXPECT_EQ(Run(kActions[4], index_, {"-f", "body", "-f", "body"}).errors, "clean\n");
}

// An index without a manifest is checked as a whole before it is used, one with a manifest block by block: then nothing
// but what was written is ever answered. Without a digest are the settings, and without a checksum older commits.
TEST_P(ReliabilityDamage, SearchingAndMergingEndsInAnAnswerOrAnErrorOfTheEngine) {
  const int damages = std::max(1, RunSize("QUORELASTIC_USE_DAMAGES", 8) / kFewer);
  WriteSettings();
  const std::string manifest = ManifestOfIndex();
  std::map<size_t, std::string> intact;
  for (int i = 0; i < damages; ++i) {
    const size_t number = Below(std::min<size_t>(contents_.terms.size(), 40));
    const auto& term = contents_.terms[number];
    if (!intact.contains(number)) {
      MakeCopy();
      intact[number] = UseCopy(term).output;
      ASSERT_THAT(intact[number], AllOf(HasSubstr("*:*: "), Not(HasSubstr("error: open"))));
    }
    const std::vector<std::string> files = ListFolder(index_);
    const Damage damage = RandomDamageTo(index_, files[Below(files.size())], random_);
    for (const bool has_manifest : {false, true}) {
      const DamagedFile damaged(index_, damage);
      MakeCopy();
      if (has_manifest) WriteFile(copy_ + "/quorelastic.manifest", manifest);
      SCOPED_TRACE("damage " + std::to_string(i) + (has_manifest ? ", manifest" : "") + ", " + term.first +
                   ":" + term.second + ": " + damage.Describe());
      const LimitedRun run = UseCopy(term);
      ++tally_.runs;
      EXPECT_EQ(run.status, 0) << run.output << run.errors;
      const bool reported = run.output.find("error: ") != std::string::npos;
      ++(reported ? tally_.reported : run.output == intact[number] ? tally_.alike : tally_.different);
      const bool is_unnoticed = damage.file == "quorelastic.json" ||
                                (GetParam().older_layout != nullptr && damage.file.starts_with("segments"));
      if (has_manifest && !reported && !is_unnoticed) {
        EXPECT_EQ(run.output, intact[number]);
      }
    }
    if (HasFailure()) break;
  }
  TellTally(damages);
}

}  // namespace
}  // namespace quorelastic::testing
