#pragma once
// Virtual time is no longer a test double alone (showctl simulate runs on it):
// it lives in ports/. This name stays for the tests that include it here.
#include "ports/ManualClock.h"
