// What the offline actions make of failures, here of a suggester's.

#include "error/report_lucene_errors.h"

#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <functional>
#include <iostream>
#include <sstream>
#include <stdexcept>

#include "error/error.h"
#include "vantrel/elastic/index_container.h"
#include "vantrel/elastic/prefix_term_suggester.h"
#include "vantrel/elastic/term_suggester.h"

namespace {

using vantrel::elastic::Suggestion;
using vantrel::elastic::TermSuggester;

class FailingBackEnd : public vantrel::elastic::TermSuggesterImpl {
 public:
  explicit FailingBackEnd(std::function<void()> fail) : fail_(std::move(fail)) {}

  std::vector<Suggestion> Suggest(const std::string& /*field*/, const std::string& /*prefix*/,
                                  uint64_t /*most*/) const override {
    fail_();
    return {};
  }

 private:
  std::function<void()> fail_;
};

// What is printed on each of the two streams.
struct Printed {
  std::string narrow;
  std::wstring wide;

  bool operator==(const Printed&) const = default;
};

Printed Report(const std::shared_ptr<vantrel::elastic::TermSuggesterImpl>& back_end) {
  std::ostringstream narrow;
  std::wostringstream wide;
  std::streambuf* const narrow_before = std::cout.rdbuf(narrow.rdbuf());
  std::wstreambuf* const wide_before = std::wcout.rdbuf(wide.rdbuf());
  ReportLuceneErrors([&] {
    TermSuggester suggester;
    suggester.AddBackEnd(back_end);
    suggester.GetSuggest("f", "t", 0, 10);
    std::cout << "no failure";
  });
  std::cout.rdbuf(narrow_before);
  std::wcout.rdbuf(wide_before);
  return {narrow.str(), wide.str()};
}

Printed ReportThrown(const std::function<void()>& fail) {
  return Report(std::make_shared<FailingBackEnd>(fail));
}

TEST(ReportLuceneErrorsTest, AFailureOfTheIndexLibraryIsOneLineOnTheWideOutput) {
  EXPECT_EQ(ReportThrown([] { throw Lucene::LuceneException(L"what it says"); }),
            (Printed{"", L"LuceneException: what it says\n"}));
  EXPECT_EQ(ReportThrown([] { throw Lucene::IOException(L"Read past EOF"); }),
            (Printed{"", L"LuceneException: Read past EOF\n"}));
}

TEST(ReportLuceneErrorsTest, AnyOtherFailureIsOneLineWithoutABlank) {
  EXPECT_EQ(ReportThrown([] { throw std::logic_error("what it says"); }),
            (Printed{"Exception:what it says\n", L""}));
  EXPECT_EQ(ReportThrown([] { throw vantrel::Error(vantrel::Error::kInvalidInput, "ours"); }),
            (Printed{"Exception:ours\n", L""}));
}

TEST(ReportLuceneErrorsTest, AnIndexThatIsNotThereFailsWhenSuggestionsAreAskedFor) {
  const auto index = vantrel::elastic::IndexContainer::Instance()->IndexGet("/nowhere/at/all");
  const std::vector<std::shared_ptr<vantrel::elastic::Index>> indexes = {index};
  EXPECT_EQ(
      Report(std::make_shared<vantrel::elastic::PrefixTermSuggester>(indexes, 10)),
      (Printed{"Exception:/nowhere/at/all: cannot open index folder: No such file or directory\n", L""}));
}

TEST(ReportLuceneErrorsTest, LetsOtherKindsOfExceptionsPass) {
  EXPECT_THROW(ReportLuceneErrors([] { throw 42; }), int);
}

TEST(ReportLuceneErrorsTest, AFailureComesBehindWhatWasPrinted) {
  const Printed printed = ReportThrown([] {
    std::cout << "pos: 1" << std::endl;
    throw std::out_of_range("too far");
  });
  EXPECT_EQ(printed, (Printed{"pos: 1\nException:too far\n", L""}));
}

TEST(ReportLuceneErrorsTest, WhereNothingFailsNothingIsAdded) {
  EXPECT_EQ(ReportThrown([] {}), (Printed{"no failure", L""}));
}

}  // namespace
