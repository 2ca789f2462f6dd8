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

void addInventory(Verbs& verbs) {
  const auto running = std::make_shared<bool>(false);
  const auto product = std::make_shared<std::string>();
  Verb verb = verbs.add("inventory", "List the installed products.", defaultTimeoutSeconds, [running, product] {
    Predicates predicates;
    if (!product->empty()) predicates.push_back({"PRODUCT", "eq", *product});
    if (*running) predicates.push_back({"PRODDESC", "eq", "RUNNING"});
    checkSendable(predicates);
    return [predicates](Session& session) { return run(session, predicates); };
  });
  verb.text("PRODUCT", *product, "Only this product code");
  verb.flag("--running", *running, "Only products that run");
  verb.footer(
      "Examples:\n"
      "  vmqctl inventory\n"
      "  vmqctl inventory ux -o json");
}

}  // namespace vmqctl
