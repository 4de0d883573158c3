#pragma once

#include "Json.h"

#include <korvane/platform/CMTime.h>

#include <string>

/// In the form that `parseTime` reads: "1001/30000", "-inf", "inval". The rounded bit and the epoch
/// do not show.
std::string timeFraction(CMTime const& time);

/// { "value", "timescale", "seconds", "rounded" } of a number, else { "kind": "inf" }.
Json timeJson(CMTime const& time);

/// "01:02:05,500", with a sign before zero; milliseconds are cut.
std::string timecodeText(double seconds);
