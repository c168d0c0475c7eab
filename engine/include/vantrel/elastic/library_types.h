#pragma once

// The types of the index library (Lucene++) that public interfaces name, declared without its headers, which take
// seconds to parse. Code that uses an object behind one of these pointers includes <lucene++/LuceneHeaders.h>.

#include <boost/smart_ptr/shared_ptr.hpp>
#include <string>

namespace Lucene {

class Filter;
class IndexReader;
class Term;
class TermFreqVector;
class TermPositions;

using FilterPtr = boost::shared_ptr<Filter>;
using IndexReaderPtr = boost::shared_ptr<IndexReader>;
using String = std::wstring;
using TermFreqVectorPtr = boost::shared_ptr<TermFreqVector>;
using TermPositionsPtr = boost::shared_ptr<TermPositions>;
using TermPtr = boost::shared_ptr<Term>;

}  // namespace Lucene
