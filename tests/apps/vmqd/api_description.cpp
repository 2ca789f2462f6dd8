#include "tests/apps/vmqd/api_description.h"

#include <set>
#include <stdexcept>

using nlohmann::json;

namespace {

bool hasType(const json& value, const std::string& type) {
  if (type == "object") return value.is_object();
  if (type == "array") return value.is_array();
  if (type == "string") return value.is_string();
  if (type == "integer") return value.is_number_integer();
  if (type == "boolean") return value.is_boolean();
  throw std::runtime_error("unknown type " + type);
}

void refuseUnknownKeywords(const YAML::Node& schema) {
  static const std::set<std::string> known = {"type",          "required",    "properties", "additionalProperties",
                                              "items",         "enum",        "oneOf",      "minProperties",
                                              "maxProperties", "description", "example"};
  for (const auto& member : schema) {
    if (known.count(member.first.as<std::string>()) == 0) {
      throw std::runtime_error("unknown keyword " + member.first.as<std::string>());
    }
  }
}

}  // namespace

ApiDescription::ApiDescription(const std::string& file) : document_(YAML::LoadFile(file)) {}

YAML::Node ApiDescription::resolved(const YAML::Node& node) const {
  if (!node["$ref"]) return node;
  const auto reference = node["$ref"].as<std::string>();
  YAML::Node found = YAML::Clone(document_);
  for (size_t begin = reference.find('/') + 1; begin != 0;) {
    const size_t end = reference.find('/', begin);
    found = YAML::Node(found[reference.substr(begin, end - begin)]);
    if (!found) throw std::runtime_error("nothing at " + reference);
    begin = end + 1;
  }
  return found;
}

YAML::Node ApiDescription::schema(const std::string& name) const {
  const YAML::Node found = document_["components"]["schemas"][name];
  if (!found) throw std::runtime_error("no schema " + name);
  return found;
}

std::string ApiDescription::mismatch(const json& value, const YAML::Node& unresolved, const std::string& place) const {
  const YAML::Node schema = resolved(unresolved);
  refuseUnknownKeywords(schema);
  if (schema["type"] && !hasType(value, schema["type"].as<std::string>())) {
    return place + " is no " + schema["type"].as<std::string>();
  }
  if (const YAML::Node choices = schema["oneOf"]) {
    int matching = 0;
    for (const auto& choice : choices) matching += mismatch(value, choice, place).empty() ? 1 : 0;
    if (matching != 1) return place + " is " + std::to_string(matching) + " of the choices";
  }
  if (const YAML::Node values = schema["enum"]) {
    bool found = false;
    for (const auto& each : values) found = found || value == each.as<std::string>();
    if (!found) return place + " is none of the values listed";
  }
  if (const YAML::Node items = schema["items"]; items && value.is_array()) {
    for (size_t index = 0; index < value.size(); ++index) {
      const std::string wrong = mismatch(value[index], items, place + "[" + std::to_string(index) + "]");
      if (!wrong.empty()) return wrong;
    }
  }
  if (!value.is_object()) return "";
  if (schema["minProperties"] && value.size() < schema["minProperties"].as<size_t>())
    return place + " has too few members";
  if (schema["maxProperties"] && value.size() > schema["maxProperties"].as<size_t>())
    return place + " has too many members";
  for (const auto& name : schema["required"]) {
    if (!value.contains(name.as<std::string>())) return place + " lacks " + name.as<std::string>();
  }
  const YAML::Node others = schema["additionalProperties"];
  for (const auto& [name, member] : value.items()) {
    const YAML::Node described =
        schema["properties"] ? schema["properties"][name] : YAML::Node(YAML::NodeType::Undefined);
    std::string wrong;
    if (described) {
      wrong = mismatch(member, described, place + "." + name);
    } else if (others && others.IsMap()) {
      wrong = mismatch(member, others, place + "." + name);
    } else if (others && !others.as<bool>()) {
      wrong = place + " has an undescribed member " + name;
    }
    if (!wrong.empty()) return wrong;
  }
  return "";
}
