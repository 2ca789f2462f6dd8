// query: the rows of a table.

#include <memory>

#include "apps/vmqctl/commands/verbs.h"

namespace vmqctl {
namespace {

constexpr unsigned defaultTimeoutSeconds = 600;  // some queries run a command and wait for it

struct Arguments {
  std::string table;
  std::vector<std::string> predicates;
};

ExitCode run(Session& session, const std::string& tableName, const Predicates& predicates) {
  session.progress.turn("waiting for the rows of " + tableName);
  const std::vector<Json> rows = session.client.query(tableName, predicates);
  session.progress.clear();

  const Stream& out = session.console.out();
  if (session.format == Format::AsJson) {
    session.console.data(jsonText(Json(rows), /*oneLine=*/false, out));
  } else if (rows.empty()) {
    session.console.line("no rows");
  } else {
    std::vector<std::string> columns;
    for (const auto& [name, value] : rows.front().items()) columns.push_back(name);
    session.console.data(table(columns, rows, layoutFor(out)));
  }
  return ExitCode::Done;
}

}  // namespace

void addQuery(Verbs& verbs) {
  const auto arguments = std::make_shared<Arguments>();
  Verb verb = verbs.add("query", "Show the rows of a table. With KAGREQT this runs the command it names.",
                        defaultTimeoutSeconds, [arguments] {
                          Predicates predicates;
                          for (const std::string& text : arguments->predicates) {
                            predicates.push_back(parsePredicate(text));
                          }
                          checkSendable(predicates);
                          return [name = arguments->table, predicates](Session& session) {
                            return run(session, name, predicates);
                          };
                        });
  verb.text("TABLE", arguments->table, "KAGREQT, KINAGT or KAGDYST (vmqctl status lists them)").required();
  verb.texts("COLUMN=VALUE", arguments->predicates, "Only rows like this; also with !=, <, <=, >, >= (quote them)");
  verb.footer(
      "Examples:\n"
      "  vmqctl query KINAGT\n"
      "  vmqctl query KAGREQT COMMAND=GETCONFIG TRANSID=t1 PRODUCT=ux -o json\n"
      "  vmqctl query KAGREQT COMMAND=STOP TRANSID=t2 PRODUCT=ux 'RETVAL!=0'");
}

}  // namespace vmqctl
