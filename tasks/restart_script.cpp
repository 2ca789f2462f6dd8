#include "tasks/restart_script.h"

using VMQ::String;

namespace {

/// Directories that bundles leave in the depot.
constexpr const char* STAGED_PRODUCTS[] = {"ui", "ci", "jr", "gs", "dd", "ax", "la", "uf", "ux"};

String removal(const String& directory) {
  return String("rm -rf ") + directory + " >/dev/null 2>&1\n";
}

String removals(const String& depot, const String& product) {
  String lines;
  for (const char* staged : STAGED_PRODUCTS) lines.append(removal(depot + staged));
  return lines + removal(depot + product);
}

/// The translator's exit code takes the place of the installer's.
String translatorStep(const String& depot, const String& translatorCommand) {
  return String("if [ \"$RETCODE\" -eq \"0\" ]; then\n") +                                 //
         translatorCommand + " 2>>" + depot + "stderr.txt 1>>" + depot + "stdout.txt\n" +  //
         "RETCODE=$?\n"
         "fi\n";
}

}  // namespace

String restartScript(const String& depot, const String& product, const String& translatorCommand) {
  const String run = String(
                         "#!/bin/sh\n"
                         "trap \"true\" 13 15\n"
                         "rm -f rc.txt >/dev/null 2>&1\n"
                         "$* 2>") +
                     depot + "stderr.txt 1>" + depot +
                     "stdout.txt\n"
                     "RETCODE=$?\n";
  const String keep = "export RETCODE\n";
  const String clean = removals(depot, product);
  const String end = String("echo $RETCODE > ") + depot +
                     "rc.txt\n"
                     "exit $RETCODE\n";
  if (translatorCommand.length() == 0) return run + keep + clean + end;
  return run + translatorStep(depot, translatorCommand) + clean + keep + end;
}
