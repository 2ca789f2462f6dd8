#pragma once

/// The installation home: the text that the environment lookup of CORVELHOME returned at start-up, null when it was
/// unset. Written once by Initialize_Corvel_Home before any request, read freely afterwards.
extern const char* VMQ_CORVELHOME;
