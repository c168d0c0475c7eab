#pragma once

#include <string>
#include <vector>

#include "commands/shape.h"

namespace quorelasticd {

// A member of a request, as documents list it.
struct MemberRow {
  std::string name;  // from the request's data on, such as "settings.fields[].name"
  std::string type;
  bool is_required = false;
  std::string meaning;
};

// The members of a command's data, each followed by those within it.
inline void AddMemberRows(const Shape& shape, const std::string& prefix, std::vector<MemberRow>& rows) {
  for (const Member& member : shape.members) {
    const std::string name = prefix + member.name;
    rows.push_back({name, Describe(member.shape), member.is_required, member.meaning});
    if (member.shape.kind == Shape::Kind::kArray) AddMemberRows(member.shape.of.front(), name + "[].", rows);
    AddMemberRows(member.shape, name + ".", rows);
  }
}

inline std::vector<MemberRow> MemberRows(const Shape& shape) {
  std::vector<MemberRow> rows;
  AddMemberRows(shape, "", rows);
  return rows;
}

}  // namespace quorelasticd
