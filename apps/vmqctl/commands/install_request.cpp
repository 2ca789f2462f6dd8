// The install request.

#include "apps/vmqctl/commands/install_request.h"

namespace vmqctl {

Argument takesProduct(Verb& verb, InstallArguments& a) {
  return verb.text("PRODUCT", a.product, "Product code, such as ux").required();
}

Argument takesVersion(Verb& verb, InstallArguments& a) {
  return verb.text("--version V", a.version, "Version of the product, such as 06.20");
}

Argument takesCommand(Verb& verb, InstallArguments& a, const std::string& description) {
  return verb.text("--command CMD", a.installer,
                   description + "; |DEPLOYDIR|, |DEPOTDIR| and |CORVELHOME| are replaced");
}

void takesInstallSteps(Verb& verb, InstallArguments& a) {
  const Argument setRms =
      verb.flag("--set-rms", a.setRms, "Afterwards register the product with its management server");
  verb.flag("--restart", a.restart, "The installer restarts vmqd; ask complete-install for its outcome")
      .excludes(setRms);
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
