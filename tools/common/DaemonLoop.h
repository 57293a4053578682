#pragma once
// The life of a small periodic service: work once, tell the host it is
// ready, then work again every interval until SIGTERM or SIGINT.

#include <chrono>
#include <functional>
#include <string>
#include <string_view>

namespace qv::tools {

/// Runs `work` at once and then every `interval`; returns 0 after a stop
/// signal, 1 when the first `work` throws (later failures are logged and
/// retried at the next turn). `onStop` runs once before returning.
int RunPeriodicService(const char* program, std::chrono::milliseconds interval, const std::function<void()>& work,
                       const std::function<void()>& onStop);

/// `text` as a JSON string literal, quotes included.
std::string JsonString(std::string_view text);

/// The current UTC time as "YYYY-MM-DDTHH:MM:SSZ".
std::string UtcTimeText();

/// Reads "--interval MS" from the command line; `fallback` when absent.
/// A bad value prints a message and exits with code 2.
std::chrono::milliseconds IntervalOption(int argc, char** argv, std::chrono::milliseconds fallback);

} // namespace qv::tools
