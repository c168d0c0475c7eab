// Checks an index by the index library's own checker, and ends with status 0 where it is clean.

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/CheckIndex.h>

#include <iostream>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_library_check FOLDER\n";
    return 2;
  }
  const auto checker = Lucene::newLucene<Lucene::CheckIndex>(
      Lucene::FSDirectory::open(Lucene::StringUtils::toUnicode(argv[1])));
  return checker->checkIndex()->clean ? 0 : 1;
}
