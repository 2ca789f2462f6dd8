// The install request.

#include "apps/vmqctl/commands/install_request.h"

#include "apps/vmqctl/commands/verbs.h"

namespace vmqctl {

void takesProduct(CLI::App& verb, InstallArguments& a) {
  verb.add_option("PRODUCT", a.product, "Product code, such as ux")->type_name("")->required()->check(notEmpty);
}

void takesVersion(CLI::App& verb, InstallArguments& a, bool required) {
  verb.add_option("--version", a.version, "Version of the product, such as 06.20")
      ->type_name("V")
      ->required(required)
      ->check(notEmpty);
}

void takesCommand(CLI::App& verb, InstallArguments& a, bool required, const char* description) {
  verb.add_option("--command", a.installer,
                  std::string(description) + "; |DEPLOYDIR|, |DEPOTDIR| and |CORVELHOME| are replaced")
      ->type_name("CMD")
      ->required(required)
      ->check(notEmpty);
}

void takesInstallSteps(CLI::App& verb, InstallArguments& a) {
  CLI::Option* const setRms =
      verb.add_flag("--set-rms", a.setRms, "Afterwards register the product with its management server");
  verb.add_flag("--restart", a.restart, "The installer restarts vmqd; ask complete-install for its outcome")
      ->excludes(setRms);
}

Request installRequest(const InstallArguments& a) {
  Request request;
  request.command = "INSTALL";
  addParameter(request, "PRODUCT", a.product);
  addParameter(request, "VERSION", a.version);
  addParameter(request, "CONTEXT", a.installer);
  if (a.setRms) addParameter(request, "OPTIONAL", "SETRMS");
  if (a.restart) {
    addParameter(request, "OPTIONAL", "REQUIRES_RESTART");
    request.afterSuccess = "The installer runs on by itself. Ask for its outcome with: vmqctl complete-install.";
  }
  return request;
}

void addParameter(Request& request, const char* column, const std::string& value) {
  if (!value.empty()) request.parameters.push_back({column, "eq", value});
}

}  // namespace vmqctl
