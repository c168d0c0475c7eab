#include "support/varied_index.h"

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/OffsetAttribute.h>
#include <lucene++/Payload.h>
#include <lucene++/PayloadAttribute.h>
#include <lucene++/PositionIncrementAttribute.h>
#include <lucene++/SerialMergeScheduler.h>
#include <lucene++/TermAttribute.h>

#include <random>
#include <vector>

namespace quorelastic::testing {
namespace {

using Lucene::newLucene;
using Lucene::String;
using Lucene::StringUtils;

class Random {
 public:
  explicit Random(uint32_t seed) : random_(seed) {}

  // Below `bound`; not by a distribution of the standard library, which differs between implementations.
  uint32_t Below(uint32_t bound) { return static_cast<uint32_t>(random_()) % bound; }
  bool OneIn(uint32_t count) { return Below(count) == 0; }

  std::string Word() {
    static const std::vector<std::string> kPieces = {"a",
                                                     "b",
                                                     "the",
                                                     "x",
                                                     "\xc3\xa4",
                                                     "\xd0\xb6",
                                                     "Z",
                                                     "zz",
                                                     "07",
                                                     "\xe4\xb8\xad",
                                                     "\xef\xbf\xbd",
                                                     "\xf0\x9f\x98\x80",
                                                     "o"};
    std::string word;
    for (uint32_t left = 1 + Below(1 + Below(9)); left > 0; --left) {
      word += kPieces[Below(static_cast<uint32_t>(kPieces.size()))];
    }
    return OneIn(300) ? word + std::string(300, 'q') : word;
  }

 private:
  std::mt19937 random_;
};

// Words, each with a payload of some length or none, some at the place of the word before.
class PayloadStream : public Lucene::TokenStream {
 public:
  LUCENE_CLASS(PayloadStream);

  PayloadStream(std::vector<String> words, uint32_t seed) : words_(std::move(words)), random_(seed) {}

  void initialize() override {
    Lucene::TokenStream::initialize();
    term_ = addAttribute<Lucene::TermAttribute>();
    payload_ = addAttribute<Lucene::PayloadAttribute>();
    increment_ = addAttribute<Lucene::PositionIncrementAttribute>();
  }

  bool incrementToken() override {
    if (next_ == words_.size()) return false;
    clearAttributes();
    term_->setTermBuffer(words_[next_++]);
    increment_->setPositionIncrement(
        next_ > 1 && random_.OneIn(4) ? 0 : static_cast<int32_t>(1 + random_.Below(3)));
    const auto length = random_.OneIn(3) ? random_.Below(200) : 4;
    if (random_.OneIn(5)) return true;
    auto bytes = Lucene::ByteArray::newInstance(static_cast<int32_t>(length));
    for (uint32_t i = 0; i < length; ++i)
      bytes[static_cast<int32_t>(i)] = static_cast<uint8_t>(random_.Below(256));
    payload_->setPayload(newLucene<Lucene::Payload>(bytes));
    return true;
  }

 private:
  std::vector<String> words_;
  Random random_;
  size_t next_ = 0;
  Lucene::TermAttributePtr term_;
  Lucene::PayloadAttributePtr payload_;
  Lucene::PositionIncrementAttributePtr increment_;
};

Lucene::AbstractField::TermVector RandomVector(Random& random) {
  constexpr Lucene::AbstractField::TermVector kKinds[] = {
      Lucene::AbstractField::TERM_VECTOR_NO, Lucene::AbstractField::TERM_VECTOR_YES,
      Lucene::AbstractField::TERM_VECTOR_WITH_POSITIONS, Lucene::AbstractField::TERM_VECTOR_WITH_OFFSETS,
      Lucene::AbstractField::TERM_VECTOR_WITH_POSITIONS_OFFSETS};
  return kKinds[random.Below(5)];
}

class Writer {
 public:
  Writer(const std::string& path, const VariedIndexShape& shape)
      : shape_(shape),
        random_(shape.seed),
        folder_(Lucene::FSDirectory::open(StringUtils::toUnicode(path))) {}

  void Write() {
    Open();
    for (int number = 0; number < shape_.documents; ++number) {
      writer_->addDocument(Document(number));
      if (shape_.documents_per_commit > 0 && (number + 1) % shape_.documents_per_commit == 0)
        writer_->commit();
    }
    writer_->commit();
    if (shape_.optimize) writer_->optimize();
    for (int i = 0; i < shape_.deletions; ++i) {
      const auto number = random_.Below(static_cast<uint32_t>(shape_.documents));
      writer_->deleteDocuments(newLucene<Lucene::Term>(L"id", StringUtils::toString(number)));
    }
    writer_->close();
    if (shape_.changed_norms > 0) ChangeNorms();
  }

 private:
  void Open() {
    writer_ = newLucene<Lucene::IndexWriter>(folder_, newLucene<Lucene::WhitespaceAnalyzer>(), true,
                                             Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
    const auto policy = newLucene<Lucene::LogDocMergePolicy>(writer_);
    policy->setMergeFactor(1000);
    policy->setUseCompoundFile(shape_.compound);
    policy->setUseCompoundDocStore(shape_.compound_store);
    writer_->setMergePolicy(policy);
    writer_->setMergeScheduler(newLucene<Lucene::SerialMergeScheduler>());
    writer_->setMaxBufferedDocs(std::max(2, shape_.documents_per_segment));
    writer_->setTermIndexInterval(shape_.term_index_interval);
  }

  String Words(uint32_t most) {
    String words;
    for (uint32_t left = random_.Below(most + 1); left > 0; --left) {
      words += StringUtils::toUnicode(random_.Word()) + L" ";
    }
    return words;
  }

  // A field that is indexed, with or without norms.
  Lucene::FieldPtr Text(const String& name, const String& value, bool norms,
                        Lucene::AbstractField::TermVector vector) {
    const auto store = random_.OneIn(2) ? Lucene::AbstractField::STORE_YES : Lucene::AbstractField::STORE_NO;
    const auto field =
        newLucene<Lucene::Field>(name, value, store, Lucene::AbstractField::INDEX_ANALYZED, vector);
    field->setOmitNorms(!norms);
    return field;
  }

  void AddBare(const Lucene::DocumentPtr& document, int number) {
    const auto bare = [&](const String& name, const String& value) {
      const auto field = Text(name, value, false, Lucene::AbstractField::TERM_VECTOR_NO);
      field->setOmitTermFreqAndPositions(true);
      document->add(field);
    };
    bare(L"id", StringUtils::toString(number));
    bare(L"bare", L"every " + Words(4));
  }

  Lucene::DocumentPtr Document(int number) {
    const auto document = newLucene<Lucene::Document>();
    AddBare(document, number);
    if (shape_.only_bare_fields) return document;
    String often = L"every every";
    if (number % 2 == 0) often += L" half";
    if (number % 16 == 3) often += L" few few few";
    document->add(Text(L"often", often, true, Lucene::AbstractField::TERM_VECTOR_NO));
    document->add(Text(L"body", Words(12), true, RandomVector(random_)));
    if (random_.OneIn(2)) document->add(Text(L"b\u00e4r", Words(5), random_.OneIn(2), RandomVector(random_)));
    if (random_.OneIn(3)) document->add(Text(L"body", Words(5), true, RandomVector(random_)));
    if (random_.OneIn(9)) document->add(Text(L"f" + Words(1), Words(2), true, RandomVector(random_)));
    if (random_.OneIn(3)) document->add(Bytes());
    if (shape_.payloads) document->add(WithPayloads(number));
    return document;
  }

  Lucene::FieldPtr Bytes() {
    auto bytes = Lucene::ByteArray::newInstance(static_cast<int32_t>(random_.Below(300)));
    for (int32_t i = 0; i < bytes.size(); ++i) bytes[i] = static_cast<uint8_t>(random_.Below(256));
    return newLucene<Lucene::Field>(L"bytes", bytes, Lucene::AbstractField::STORE_YES);
  }

  Lucene::FieldPtr WithPayloads(int number) {
    std::vector<String> words = {L"every"};
    if (number % 3 == 0) words.insert(words.end(), {L"third", L"third"});
    for (uint32_t left = random_.Below(4); left > 0; --left)
      words.push_back(StringUtils::toUnicode(random_.Word()));
    return newLucene<Lucene::Field>(
        L"loaded", newLucene<PayloadStream>(words, shape_.seed * 7919 + static_cast<uint32_t>(number)),
        RandomVector(random_));
  }

  void ChangeNorms() {
    const auto reader = Lucene::IndexReader::open(folder_, false);
    for (int i = 0; i < shape_.changed_norms; ++i) {
      const auto document = static_cast<int32_t>(random_.Below(static_cast<uint32_t>(reader->maxDoc())));
      if (reader->isDeleted(document)) continue;
      reader->setNorm(document, random_.OneIn(2) ? L"often" : L"body",
                      static_cast<uint8_t>(random_.Below(256)));
    }
    reader->close();
  }

  VariedIndexShape shape_;
  Random random_;
  Lucene::FSDirectoryPtr folder_;
  Lucene::IndexWriterPtr writer_;
};

}  // namespace

void WriteVariedIndex(const std::string& path, const VariedIndexShape& shape) { Writer(path, shape).Write(); }

VariedIndexShape RandomShape(uint32_t seed) {
  Random random(seed);
  VariedIndexShape shape{.seed = seed};
  shape.documents = static_cast<int>(1 + random.Below(random.OneIn(8) ? 400 : 40));
  shape.documents_per_segment =
      static_cast<int>(2 + random.Below(static_cast<uint32_t>(shape.documents) + 1));
  shape.documents_per_commit = random.OneIn(2) ? 0 : static_cast<int>(1 + random.Below(40));
  shape.compound = random.OneIn(2);
  shape.compound_store = random.OneIn(2);
  shape.optimize = random.OneIn(3);
  shape.deletions = random.OneIn(2) ? 0 : static_cast<int>(random.Below(10));
  shape.changed_norms = random.OneIn(3) ? static_cast<int>(random.Below(6)) : 0;
  shape.term_index_interval = static_cast<int>(1 + random.Below(random.OneIn(2) ? 5 : 128));
  shape.payloads = !random.OneIn(4);
  shape.only_bare_fields = random.OneIn(12);
  return shape;
}

}  // namespace quorelastic::testing
