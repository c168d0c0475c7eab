#pragma once

#include <map>
#include <string>
#include <vector>

namespace quorelastic::testing {

// What the tests read of docs/protocol.md.
struct ProtocolDocument {
  // A fenced exchange, line by line.
  struct Transcript {
    int line = 0;  // in the document, of its first line
    std::vector<std::string> lines;
  };

  // A heading with what stands below it, up to the next heading of any level.
  struct Section {
    std::vector<std::string> paragraph;  // its first paragraph, line by line
    // The rows of its first table, cell by cell, without its head.
    std::vector<std::vector<std::string>> table;
  };

  std::string text;
  std::map<std::string, Section> sections;          // by heading
  std::vector<Transcript> transcripts;              // in their order
  std::map<std::string, std::string> import_files;  // by name
};

ProtocolDocument ReadProtocolDocument();

}  // namespace quorelastic::testing
