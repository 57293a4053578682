#pragma once
// A fixture for tests that run real services: a private configuration and
// runtime directory, helpers to define scripted services, and a tear-down
// that stops (or kills) everything that was started.

#include "fen/osdep/Daemon.h"
#include "fen/osdep/ServiceDefinition.h"
#include "fen/osdep/ServiceRuntime.h"
#include "fen/osdep/ServiceStatus.h"
#include "support/TemporaryHome.h"

#include <chrono>
#include <functional>
#include <gtest/gtest.h>
#include <string>
#include <vector>

namespace qv::test {

/// True when `pid` has ended (a zombie waiting for its parent counts).
bool ProcessGone(int pid);

/// Polls `condition` every 20 ms for up to `limit`; its last answer.
bool WaitUntil(const std::function<bool()>& condition, std::chrono::milliseconds limit);

/// Holds the exclusive mark of some services from a child process, as a
/// process that is not a service host might.
class ForeignMark {
public:
    explicit ForeignMark(const std::vector<std::string>& names);
    ~ForeignMark();
    ForeignMark(const ForeignMark&) = delete;
    ForeignMark& operator=(const ForeignMark&) = delete;

private:
    int pid_ = -1;
};

class ServiceTest : public ::testing::Test {
protected:
    void TearDown() override;

    /// Defines `name` to run the scripted test service with `options`.
    void Define(const std::string& name, const std::string& options, std::vector<std::string> dependOn = {},
                std::uint32_t waitHint = 3000);

    /// The status of a defined service.
    fen::osdep::ServiceStatus StatusOf(const std::string& name);

    /// The file scripted services record their starts and stops in.
    std::string RecordFile() const { return (home_.Runtime() / "record.txt").string(); }
    /// Its lines.
    std::vector<std::string> Recorded() const;

    static fen::WString W(const std::string& name) { return fen::osdep::WideName(name); }

    TemporaryHome home_;
};

} // namespace qv::test
