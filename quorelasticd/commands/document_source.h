#pragma once

#include <json/value.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>

#include "commands/document_json.h"

namespace quorelasticd {

// Where the documents of a bulk come from, one after the other.
class DocumentSource {
 public:
  struct Item {
    uint64_t position = 0;  // from 1: of the element, or of the line
    vantrel::elastic::Document document;
    std::string problem;  // why there is no document; empty where there is one
  };

  enum class Move {
    kItem,
    kNotYet,  // it takes longer: to be asked again
    kEnd,
  };

  DocumentSource() = default;
  DocumentSource(const DocumentSource&) = delete;
  DocumentSource& operator=(const DocumentSource&) = delete;
  virtual ~DocumentSource() = default;

  // Sets `item` where there is a next one, and waits no longer than `most` for it. Throws std::system_error where it
  // cannot be read.
  virtual Move Next(std::chrono::milliseconds most, Item& item) = 0;

  // Adds how far it has come, and how far it goes.
  virtual void DescribeProgress(Json::Value& progress) const = 0;
};

// The elements of an array.
std::unique_ptr<DocumentSource> InlineDocuments(Json::Value documents);

// The lines of a file below `folder`, blank ones passed over. While they are taken, a thread of its own reads on, some
// way ahead. Throws like ImportFile.
std::unique_ptr<DocumentSource> ImportedDocuments(const std::string& folder, const std::string& name);

}  // namespace quorelasticd
