// inventory: the installed products.

#include <memory>

#include "apps/vmqctl/commands/verbs.h"

namespace vmqctl {
namespace {

constexpr unsigned defaultTimeoutSeconds = 600;  // the inventory tool looks at the whole installation

ExitCode run(Session& session, const Predicates& predicates) {
  session.progress.turn("asking the installation for its products");
  const std::vector<Json> rows = session.client.query("KINAGT", predicates);
  session.progress.clear();
  const Stream& out = session.console.out();
  if (session.format == Format::AsJson) {
    session.console.data(jsonText(Json(rows), /*oneLine=*/false, out));
  } else if (rows.empty()) {
    session.console.line("no products");
  } else {
    session.console.data(table({"PRODUCT", "VERSION", "RELEASE", "PLATFORM", "PRODDESC"}, rows, layoutFor(out)));
  }
  return ExitCode::Done;
}

}  // namespace

void addInventory(CLI::App& app, Invocation& invocation) {
  const auto running = std::make_shared<bool>(false);
  const auto product = std::make_shared<std::string>();
  CLI::App* const sub = app.add_subcommand("inventory", "List the installed products.");
  sub->add_option("PRODUCT", *product, "Only this product code")->type_name("")->check(notEmpty);
  sub->add_flag("--running", *running, "Only products that run");
  addCommonOptions(*sub, invocation, defaultTimeoutSeconds);
  sub->footer(
      "Examples:\n"
      "  vmqctl inventory\n"
      "  vmqctl inventory ux -o json");
  sub->callback([&invocation, running, product] {
    Predicates predicates;
    if (!product->empty()) predicates.push_back({"PRODUCT", "eq", *product});
    if (*running) predicates.push_back({"PRODDESC", "eq", "RUNNING"});
    invocation.action = {defaultTimeoutSeconds, [predicates](Session& session) { return run(session, predicates); }};
  });
}

}  // namespace vmqctl
