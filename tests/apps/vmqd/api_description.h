#pragma once
// docs/api.yaml, and whether JSON is as it says.

#include <yaml-cpp/yaml.h>

#include <string>

#include "tests/support/json.h"

class ApiDescription {
 public:
  explicit ApiDescription(const std::string& file);

  [[nodiscard]] YAML::Node paths() const { return document_["paths"]; }
  /// The node itself, or what its "$ref" names. Throws std::runtime_error when that is missing.
  [[nodiscard]] YAML::Node resolved(const YAML::Node& node) const;
  /// A schema by its name.
  [[nodiscard]] YAML::Node schema(const std::string& name) const;

  /// What is wrong with a value by a schema, with its place; "" when nothing is. Throws std::runtime_error when the
  /// schema uses what is not known here, so that nothing goes unchecked.
  [[nodiscard]] std::string mismatch(const nlohmann::json& value, const YAML::Node& schema,
                                     const std::string& place = "$") const;

 private:
  const YAML::Node document_;
};
