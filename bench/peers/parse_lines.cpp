// Parses each line of a file as JSON, as the JSON library does it with its defaults.

#include <json/reader.h>

#include <fstream>
#include <iostream>
#include <memory>
#include <string>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_parse_lines FILE\n";
    return 2;
  }
  const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
  std::ifstream file(argv[1]);
  size_t parsed = 0;
  for (std::string line; std::getline(file, line);) {
    Json::Value value;
    if (reader->parse(line.data(), line.data() + line.size(), &value, nullptr)) ++parsed;
  }
  std::cout << parsed << " parsed" << std::endl;
  return parsed > 0 ? 0 : 1;
}
