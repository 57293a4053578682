#pragma once
/// \file
/// Whether a Quality cell text reports a bad value, for the "XX" display
/// option.
///
/// The cell text is the quality word's flag names joined by ";", possibly
/// followed by "; error code: " and a negative code. The watch list knows
/// ten bad conditions; each stands for these flag names of the value model:
///
/// | Condition                 | Flag names                                                            |
/// |---------------------------|-----------------------------------------------------------------------|
/// | Sensor Failure            | "sensor failure"                                                      |
/// | Device Failure            | "device error"                                                        |
/// | Server Failure            | "server failure", "process failure"                                   |
/// | Network Failure           | "communication failure", "DNS failure", "host unreachable",           |
/// |                           | "service lookup failure"                                              |
/// | Nonexistant Point         | "nonexistant", "resolve URL failure", "invalid URL"                   |
/// | Bad                       | "no known value", "access denied", "math exception"                   |
/// | Sensor Inaccurate         | "sensor inaccurate"                                                   |
/// | Comm Link Failure         | "communications link failure"                                         |
/// | Disconnected from Server  | "disconnected"                                                        |
/// | Unspecified Failure       | "subscription failure", or an error-code suffix (a negative code)     |
///
/// A text is bad when any one of its flag names is in this table, or when it
/// carries an error code. Every other flag ("stale", "inactive", "forced",
/// the limits, "constant", "subnormal", "connecting", "in alarm", the
/// application-defined and buffer flags) leaves the value worth showing, and
/// "good" alone is good. Names are compared exactly, letter case included.

#include <string_view>

namespace qv::views {

bool IsBadQualityText(std::string_view cellText);

} // namespace qv::views
