#pragma once
/// \file
/// A real mosquitto broker for tests: started on a free loopback port with a
/// generated configuration, stopped (and restarted on the same port) on
/// demand, and always stopped and cleaned up by the destructor.
///
/// Everything stays on 127.0.0.1. The broker runs as a child process of the
/// test; should the test die, the kernel kills the broker with it.

#include <cstdint>
#include <filesystem>
#include <map>
#include <string>
#include <sys/types.h>

namespace qv::test {

struct TestBrokerOptions {
    /// User name to password. When not empty the broker asks for a login and
    /// refuses anonymous clients; the password file is made with mosquitto_passwd.
    std::map<std::string, std::string> users;
    /// Text of an access-control list file ("user NAME", "topic read|write|readwrite
    /// FILTER", ...); empty for none, which lets every client read and write everything.
    std::string acl;
    /// set_tcp_nodelay of the listener.
    bool tcpNoDelay = true;
    /// Extra lines appended to the configuration.
    std::string extraConfig;
};

class TestBroker {
public:
    /// Writes the configuration and starts the broker; throws std::runtime_error
    /// when it does not accept connections within a few seconds.
    explicit TestBroker(TestBrokerOptions options = {});
    /// Stops the broker and removes its folder.
    ~TestBroker();
    TestBroker(const TestBroker&) = delete;
    TestBroker& operator=(const TestBroker&) = delete;

    /// The loopback address, "127.0.0.1".
    static const char* Host() { return "127.0.0.1"; }
    /// The port; the same for the broker's whole life, across restarts.
    std::uint16_t Port() const { return port_; }
    bool IsRunning() const { return pid_ > 0; }

    /// Starts the broker again on the same port (nothing when it runs).
    void Start();
    /// Stops it with SIGTERM (an orderly shutdown) and waits for it; retained
    /// messages are gone afterwards, since the broker keeps no persistence.
    void Stop();
    /// Stop() then Start().
    void Restart();

    /// The broker's log (connections, refusals), for diagnosing a failed test.
    std::string Log() const;
    /// The folder holding the configuration, password, ACL and log files.
    const std::filesystem::path& Directory() const { return directory_; }

private:
    void WriteFiles();
    bool AcceptsConnections() const;

    TestBrokerOptions options_;
    std::filesystem::path directory_;
    std::uint16_t port_ = 0;
    pid_t pid_ = -1;
};

/// A loopback TCP port that nothing listens on at the moment of the call.
std::uint16_t FreeLoopbackPort();

} // namespace qv::test
