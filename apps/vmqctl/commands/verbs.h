#pragma once
// The verbs of the command line. Each routine adds its own, and sets `action` when one of them was typed.

#include <CLI/CLI.hpp>

#include "apps/vmqctl/settings.h"

namespace vmqctl {

/// What verbs fill in while the command line is read. Must stay where it is.
struct Invocation {
  Settings settings;
  Action action;
};

void addAgentVerbs(CLI::App& app, Invocation& invocation);    ///< start, stop, restart
void addProductVerbs(CLI::App& app, Invocation& invocation);  ///< install to set-da-config
void addPush(CLI::App& app, Invocation& invocation);
void addDeploy(CLI::App& app, Invocation& invocation);
void addInventory(CLI::App& app, Invocation& invocation);
void addQuery(CLI::App& app, Invocation& invocation);
void addWatch(CLI::App& app, Invocation& invocation);
void addStatus(CLI::App& app, Invocation& invocation);

/// --socket and -o, and --timeout with this default (seconds; 0 for no limit).
void addCommonOptions(CLI::App& verb, Invocation& invocation, unsigned defaultTimeoutSeconds);

/// For options where an empty text, say of a variable that was not set, would mean something else than was meant.
extern const CLI::Validator notEmpty;

}  // namespace vmqctl
