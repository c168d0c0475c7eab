#include "elastic/search/timed_reader.h"

#include <algorithm>
#include <utility>

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;

// What an operation takes, in documents looked at. A pattern may be tried on a term for long, and to look a term up
// reads some of the dictionary.
constexpr uint32_t kTermWeight = 32;
constexpr uint32_t kLookUpWeight = 64;

class TimedTerms : public Lucene::TermEnum {
 public:
  TimedTerms(Lucene::TermEnumPtr terms, std::shared_ptr<TimeCheck> time)
      : terms_(std::move(terms)), time_(std::move(time)) {}

  const Lucene::TermEnumPtr& inner() const { return terms_; }

  bool next() override {
    time_->Step(kTermWeight);
    return terms_->next();
  }
  Lucene::TermPtr term() override { return terms_->term(); }
  int32_t docFreq() override { return terms_->docFreq(); }
  void close() override { terms_->close(); }

 private:
  Lucene::TermEnumPtr terms_;
  std::shared_ptr<TimeCheck> time_;
};

// Offers positions only as the library's own filter does: its smaller interface is none to be derived from.
class TimedDocuments : public Lucene::TermPositions, public Lucene::LuceneObject {
 public:
  TimedDocuments(Lucene::TermDocsPtr documents, std::shared_ptr<TimeCheck> time)
      : held_(std::move(documents)), documents_(held_.get()), time_(std::move(time)) {}

  void seek(const Lucene::TermPtr& term) override {
    time_->Step(kLookUpWeight);
    documents_->seek(term);
  }

  void seek(const Lucene::TermEnumPtr& terms) override {
    time_->Step(kLookUpWeight);
    // The library goes to a term of its own kind of walk without looking it up.
    const auto timed = boost::dynamic_pointer_cast<TimedTerms>(terms);
    documents_->seek(timed ? timed->inner() : terms);
  }

  int32_t doc() override { return documents_->doc(); }
  int32_t freq() override { return documents_->freq(); }

  bool next() override {
    time_->Step();
    return documents_->next();
  }

  int32_t read(Lucene::Collection<int32_t> documents, Lucene::Collection<int32_t> frequencies) override {
    const int32_t count = documents_->read(documents, frequencies);
    time_->Step(static_cast<uint32_t>(std::max(count, 1)));
    return count;
  }

  bool skipTo(int32_t target) override {
    time_->Step();
    return documents_->skipTo(target);
  }

  void close() override { documents_->close(); }

 private:
  Lucene::TermDocsPtr held_;
  Lucene::TermDocs* documents_;
  std::shared_ptr<TimeCheck> time_;
};

class TimedPositions : public TimedDocuments {
 public:
  TimedPositions(const Lucene::TermPositionsPtr& positions, std::shared_ptr<TimeCheck> time)
      : TimedDocuments(positions, time), positions_(positions.get()), time_(std::move(time)) {}

  int32_t nextPosition() override {
    time_->Step();
    return positions_->nextPosition();
  }
  int32_t getPayloadLength() override { return positions_->getPayloadLength(); }
  Lucene::ByteArray getPayload(Lucene::ByteArray data, int32_t offset) override {
    return positions_->getPayload(std::move(data), offset);
  }
  bool isPayloadAvailable() override { return positions_->isPayloadAvailable(); }

 private:
  Lucene::TermPositions* positions_;  // which the other class holds
  std::shared_ptr<TimeCheck> time_;
};

}  // namespace

TimedReader::TimedReader(const Lucene::IndexReaderPtr& reader, std::shared_ptr<TimeCheck> time)
    : FilterIndexReader(reader), time_(std::move(time)) {}

Lucene::Collection<Lucene::IndexReaderPtr> TimedReader::getSequentialSubReaders() {
  const auto parts = in->getSequentialSubReaders();
  if (!parts) return parts;
  auto timed = Lucene::Collection<Lucene::IndexReaderPtr>::newInstance();
  for (const Lucene::IndexReaderPtr& part : parts) timed.add(newLucene<TimedReader>(part, time_));
  return timed;
}

int32_t TimedReader::docFreq(const Lucene::TermPtr& term) {
  time_->Step(kLookUpWeight);
  return in->docFreq(term);
}

Lucene::TermEnumPtr TimedReader::terms() { return newLucene<TimedTerms>(in->terms(), time_); }

Lucene::TermEnumPtr TimedReader::terms(const Lucene::TermPtr& term) {
  time_->Step(kLookUpWeight);
  return newLucene<TimedTerms>(in->terms(term), time_);
}

Lucene::TermDocsPtr TimedReader::termDocs() { return newLucene<TimedDocuments>(in->termDocs(), time_); }

Lucene::TermDocsPtr TimedReader::termDocs(const Lucene::TermPtr& term) {
  time_->Step(kLookUpWeight);
  return newLucene<TimedDocuments>(in->termDocs(term), time_);
}

Lucene::TermPositionsPtr TimedReader::termPositions() {
  return newLucene<TimedPositions>(in->termPositions(), time_);
}

Lucene::TermPositionsPtr TimedReader::termPositions(const Lucene::TermPtr& term) {
  time_->Step(kLookUpWeight);
  return newLucene<TimedPositions>(in->termPositions(term), time_);
}

}  // namespace vantrel::elastic
