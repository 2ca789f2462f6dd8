#pragma once
// The three pipes between a child and us.

#include "process/descriptor.h"

namespace VMQ {

/// A pipe. Both ends are close-on-exec, so that children started by other threads do not inherit them, and above 2, so
/// that putting one end onto a standard descriptor never overwrites another.
struct Pipe {
  Descriptor readEnd;
  Descriptor writeEnd;
};

/// Creates the pipes for a child's standard output, error and input, in this order. False, with a trace that names the
/// pipe, when one cannot be made; what was made before is closed with its object. For any thread.
bool createPipes(Pipe& stdinPipe, Pipe& stdoutPipe, Pipe& stderrPipe);

/// The same descriptor when it is above 2, else a close-on-exec duplicate above 2 (and the original is closed). Not
/// open when that failed; `errno` tells why.
Descriptor moveAboveStandard(Descriptor descriptor);

}  // namespace VMQ
