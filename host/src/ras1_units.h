#pragma once
// The known trace units and their levels.

namespace vmqhost {

/// Gives every known unit its levels again, because a capture has begun or ended.
void refreshUnits();

}  // namespace vmqhost
