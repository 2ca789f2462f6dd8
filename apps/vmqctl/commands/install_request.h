#pragma once
// The request that runs a product's installer, and its options: for every verb that ends in an install.

#include <string>

#include "apps/vmqctl/command_line.h"
#include "apps/vmqctl/commands/request.h"

namespace vmqctl {

/// Installers of large products take long, and so does what waits before them.
inline constexpr unsigned installationTimeoutSeconds = 7200;

struct InstallArguments {
  std::string product;
  std::string version;
  std::string installer;  ///< a command line with placeholders
  bool setRms = false;
  bool restart = false;
};

Argument takesProduct(Verb& verb, InstallArguments& arguments);
Argument takesVersion(Verb& verb, InstallArguments& arguments);
/// --command; `description` begins its help.
Argument takesCommand(Verb& verb, InstallArguments& arguments, const std::string& description);
/// --set-rms and --restart.
void takesInstallSteps(Verb& verb, InstallArguments& arguments);

Request installRequest(const InstallArguments& arguments);

/// Adds a parameter unless it is empty.
void addParameter(Request& request, const char* column, const std::string& value);

}  // namespace vmqctl
