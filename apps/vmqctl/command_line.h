#pragma once
// A command line of verbs, each with arguments and options: what can be typed, and where its values go.
// The only place that knows the library which parses it.

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace CLI {
class App;
class Option;
}  // namespace CLI

namespace vmqctl {

/// Says what is wrong with a value, to follow the name of its option: "must not hold blanks". "" when nothing is.
using Check = std::function<std::string(const std::string& value)>;

/// What more is to be said of an argument or an option.
class Argument {
 public:
  explicit Argument(CLI::Option* option) : option_(option) {}

  Argument& required(bool is = true);
  Argument& check(Check check);
  /// Only one of both may be given.
  Argument& excludes(const Argument& other);

 private:
  CLI::Option* option_;
};

/// The numbers that an option takes.
struct NumberRange {
  unsigned smallest = 0;
  unsigned largest = 0;
  const char* unit = "";  ///< " of seconds"
};

/// What may stand behind a verb, in the order of its help. Where values are put must outlive the parsing.
///
/// `usage` is how the help shows it: "PRODUCT" for an argument, "--target MSN" or "-o,--output NAME" for an option.
/// No text may be empty: one of a variable that was not set would mean something else than was meant.
class Verb {
 public:
  explicit Verb(CLI::App& app) : app_(app) {}

  Argument text(const std::string& usage, std::string& to, const std::string& help);
  /// Arguments, or an option that may be given several times.
  Argument texts(const std::string& usage, std::vector<std::string>& to, const std::string& help);
  Argument number(const std::string& usage, std::optional<unsigned>& to, NumberRange range, const std::string& help);
  Argument flag(const std::string& usage, bool& to, const std::string& help);
  /// What stands below its help.
  void footer(const std::string& text);

 private:
  using Values = std::vector<std::string>;
  CLI::Option* add(const std::string& usage, const std::string& help, std::function<void(const Values&)> take);

  CLI::App& app_;
};

/// One command line, to be parsed once.
class CommandLine {
 public:
  CommandLine(const std::string& program, const std::string& version, const std::string& description);
  ~CommandLine();
  CommandLine(const CommandLine&) = delete;
  CommandLine& operator=(const CommandLine&) = delete;

  /// What may stand before a verb.
  Verb& common() { return common_; }
  /// A further verb.
  Verb verb(const std::string& name, const std::string& description);

  /// Puts the values where they go. Returns the text to print when help or the version is asked for. Throws a Failure
  /// of usage.
  std::optional<std::string> parse(int argc, const char* const* argv);

  /// The name of the verb that was typed, "" without one.
  [[nodiscard]] std::string typedVerb() const;

 private:
  const std::unique_ptr<CLI::App> app_;
  Verb common_;
};

}  // namespace vmqctl
