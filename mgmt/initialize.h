#pragma once
// The component's way in.

/// Looks CORVELHOME up, keeps it in VMQ_CORVELHOME (util/corvel_home.h) and returns it; null when it is unset.
const char* Initialize_Corvel_Home();

extern "C" {
/// The one exported routine: the host agent calls it once, at start-up, on one thread. Registers the three tables, the
/// task manager and the remote-procedure interface; without CORVELHOME it does nothing. Always returns 0, also when a
/// step failed (each failure is traced).
[[gnu::visibility("default")]] unsigned Initialize_Mgmt_Functions(void);
}
