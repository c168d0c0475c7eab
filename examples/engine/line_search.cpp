// Makes an index of the lines of standard input, and prints those that a query finds, best first.
//
//   cmake -B build && cmake --build build
//   g++ -std=c++20 line_search.cpp -o line_search $(pkg-config --cflags --libs quorelastic)
//   line_search /tmp/index 'gloss*' </usr/share/dict/words

#include <vantrel/elastic/index.h>
#include <vantrel/elastic/library_setup.h>

#include <exception>
#include <iostream>
#include <string>

namespace elastic = vantrel::elastic;

namespace {

// Reads all lines; what is not committed is not found.
void AddLines(elastic::Index& index) {
  size_t number = 0;
  for (std::string line; std::getline(std::cin, line);) {
    index.Add({{{"id", std::to_string(++number)}, {"line", line}}});
  }
  index.Commit();
}

void PrintFound(const elastic::Index& index, const std::string& query) {
  elastic::SearchRequest request;
  request.query = query;
  const elastic::SearchResult result = index.Search(request);
  for (const elastic::SearchHit& hit : result.hits) {
    std::cout << hit.id << ": ";
    for (const elastic::FieldValues& field : hit.fields) {
      if (field.name == "line") std::cout << field.values.front();
    }
    std::cout << "\n";
  }
  std::cout << result.total << " found" << std::endl;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: line_search NEW_FOLDER QUERY <LINES" << std::endl;
    return 2;
  }
  try {
    elastic::PrepareIndexLibrary();
    elastic::IndexSettings settings;
    settings.fields = {{.name = "line"}};
    const auto index = elastic::Index::Create(argv[1], settings);
    AddLines(*index);
    PrintFound(*index, argv[2]);
  } catch (const std::exception& error) {
    std::cerr << "line_search: " << error.what() << std::endl;
    return 1;
  }
  return 0;
}
