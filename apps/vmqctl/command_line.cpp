// Parses command lines.

#include "apps/vmqctl/command_line.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>

#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

// CLI11 takes a "[a,b]" among several texts for two of them, "a" and "b". This byte, which no argument can hold, at the
// end of such arguments keeps them whole.
constexpr char keepsWhole = '\0';

std::string kept(std::string argument) {
  if (!argument.empty() && argument.back() == ']') argument += keepsWhole;
  return argument;
}

std::string asTyped(std::string argument) {
  if (!argument.empty() && argument.back() == keepsWhole) argument.pop_back();
  return argument;
}

/// None unless it is digits and nothing else.
std::optional<unsigned> wholeNumber(const std::string& text) {
  unsigned number = 0;
  const char* const end = text.data() + text.size();
  const auto [stopped, error] = std::from_chars(text.data(), end, number);
  return error == std::errc() && stopped == end ? std::optional<unsigned>(number) : std::nullopt;
}

std::string joined(const std::vector<std::string>& words) {
  std::string text;
  for (const std::string& word : words) text += " " + word;
  return text;
}

/// What is said of words that nothing takes.
std::string notExpected(const std::vector<std::string>& words, bool verbIsTyped) {
  const auto verb = std::find_if(words.begin(), words.end(), [](const std::string& word) { return word[0] != '-'; });
  if (!verbIsTyped && verb != words.end()) return "There is no verb " + *verb + ".";
  return std::string(words.size() == 1 ? "The following argument was not expected:"
                                       : "The following arguments were not expected:") +
         joined(words) + ".";
}

}  // namespace

Argument& Argument::required(bool is) {
  option_->required(is);
  return *this;
}

Argument& Argument::check(Check check) {
  option_->check(std::move(check));
  return *this;
}

Argument& Argument::excludes(const Argument& other) {
  option_->excludes(other.option_);
  return *this;
}

CLI::Option* Verb::add(const std::string& usage, const std::string& help, std::function<void(const Values&)> take) {
  const std::size_t blank = usage.find(' ');
  CLI::Option* const option = app_.add_option(
      usage.substr(0, blank),
      [take = std::move(take)](const CLI::results_t& values) {
        take(values);
        return true;
      },
      help);
  option->type_name(blank == std::string::npos ? "" : usage.substr(blank + 1));
  option->transform(asTyped);
  option->check([](const std::string& value) { return value.empty() ? "must not be empty" : std::string(); });
  return option;
}

Argument Verb::text(const std::string& usage, std::string& to, const std::string& help) {
  return Argument(add(usage, help, [&to](const Values& values) { to = values.front(); }));
}

Argument Verb::texts(const std::string& usage, std::vector<std::string>& to, const std::string& help) {
  CLI::Option* const option = add(usage, help, [&to](const Values& values) { to = values; });
  option->expected(CLI::detail::expected_max_vector_size);
  return Argument(option);
}

Argument Verb::number(const std::string& usage, std::optional<unsigned>& to, NumberRange range,
                      const std::string& help) {
  Argument argument(add(usage, help, [&to](const Values& values) { to = wholeNumber(values.front()); }));
  return argument.check([range](const std::string& value) {
    const std::optional<unsigned> number = wholeNumber(value);
    if (number && *number >= range.smallest && *number <= range.largest) return std::string();
    return std::string("must be a whole number") + range.unit + " from " + std::to_string(range.smallest) + " to " +
           std::to_string(range.largest);
  });
}

Argument Verb::flag(const std::string& usage, bool& to, const std::string& help) {
  return Argument(app_.add_flag(usage, to, help));
}

void Verb::footer(const std::string& text) {
  app_.footer(text);
}

CommandLine::CommandLine(const std::string& program, const std::string& version, const std::string& description)
    : app_(std::make_unique<CLI::App>(description, program)), common_(*app_) {
  app_->set_version_flag("--version", version, "Print the version and end");
  app_->set_help_flag("-h,--help", "Print this and end");
  app_->require_subcommand(0, 1);  // none at all is told below, in words that fit a mistyped verb too
}

CommandLine::~CommandLine() = default;

Verb CommandLine::verb(const std::string& name, const std::string& description) {
  return Verb(*app_->add_subcommand(name, description));
}

std::optional<std::string> CommandLine::parse(int argc, const char* const* argv) {
  std::vector<std::string> words;
  for (int i = argc - 1; i > 0; --i) words.push_back(kept(argv[i]));  // the last one first, as it wants them
  std::string sentence;
  try {
    app_->parse(std::move(words));
    if (!typedVerb().empty()) return std::nullopt;
    sentence = "No verb is given.";
  } catch (const CLI::CallForHelp&) {
    return app_->help();  // the typed verb's, when there is one
  } catch (const CLI::CallForVersion& version) {
    return std::string(version.what()) + "\n";
  } catch (const CLI::ExtrasError&) {
    std::vector<std::string> left = app_->remaining(/*recurse=*/true);
    std::transform(left.begin(), left.end(), left.begin(), asTyped);
    sentence = notExpected(left, !typedVerb().empty());
  } catch (const CLI::ParseError& error) {
    sentence = error.what();
    if (sentence.empty() || sentence.back() != '.') sentence += '.';
  }
  const std::string verb = typedVerb();
  throw Failure(ExitCode::Usage, sentence,
                "See " + app_->get_name() + " " + (verb.empty() ? "" : verb + " ") + "--help.");
}

std::string CommandLine::typedVerb() const {
  const std::vector<CLI::App*> typed = app_->get_subcommands();
  return typed.empty() ? "" : typed.front()->get_name();
}

}  // namespace vmqctl
