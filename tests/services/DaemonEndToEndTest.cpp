// The three services the monitor needs, for real: the data server is a
// mosquitto broker on a free loopback port.

#include "ServiceTestSupport.h"

#include "fen/osdep/RegKey.h"

#include <arpa/inet.h>
#include <filesystem>
#include <map>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

using namespace qv::fen::osdep;
using qv::test::ProcessGone;
using qv::test::WaitUntil;
using std::chrono::milliseconds;

namespace {

class DaemonEndToEndTest : public qv::test::ServiceTest {
protected:
    void SetUp() override
    {
        if (!std::filesystem::exists("/usr/sbin/mosquitto"))
            GTEST_SKIP() << "/usr/sbin/mosquitto is not installed (scripts/setup-deps.sh installs it)";
        port_ = FreeLoopbackPort();
        ASSERT_NE(port_, 0);
        RegKey orvek(kLocalMachine, u"SOFTWARE\\Quorvane\\Orvek", false, true, u"");
        orvek.SetValue(u"DataPort", RegValue{kRegDword, {}, {}, port_, {}});
        orvek.SetStringValue(u"DataBindAddress", u"127.0.0.1");
    }

    static std::uint16_t FreeLoopbackPort()
    {
        const int fd = ::socket(AF_INET, SOCK_STREAM, 0);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t length = sizeof address;
        std::uint16_t port = 0;
        if (::bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof address) == 0 &&
            ::getsockname(fd, reinterpret_cast<sockaddr*>(&address), &length) == 0)
            port = ntohs(address.sin_port);
        ::close(fd);
        return port;
    }

    int Connect() const
    {
        const int fd = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_port = htons(port_);
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        timeval timeout{3, 0};
        ::setsockopt(fd, SOL_SOCKET, SO_RCVTIMEO, &timeout, sizeof timeout);
        if (::connect(fd, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0) {
            ::close(fd);
            return -1;
        }
        return fd;
    }

    /// Sends an MQTT 3.1.1 CONNECT and returns the first four bytes of the answer.
    std::vector<unsigned char> ConnectAndGreet() const
    {
        const int fd = Connect();
        if (fd < 0)
            return {};
        const unsigned char connect[] = {0x10, 16,  0,   4,   'M', 'Q', 'T', 'T', 4,
                                         0x02, 0,   60,  0,   4,   'v', 'a', 'r', 'o'};
        std::vector<unsigned char> answer(4);
        ssize_t got = 0;
        if (::write(fd, connect, sizeof connect) == static_cast<ssize_t>(sizeof connect))
            got = ::recv(fd, answer.data(), answer.size(), MSG_WAITALL);
        ::close(fd);
        answer.resize(got > 0 ? static_cast<std::size_t>(got) : 0);
        return answer;
    }

    std::map<std::string, ServiceStatus> Statuses()
    {
        std::map<std::string, ServiceStatus> statuses;
        for (const std::string& name : RequiredServiceNames())
            statuses[name] = StatusOf(name);
        return statuses;
    }

    std::uint16_t port_ = 0;
};

} // namespace

TEST_F(DaemonEndToEndTest, EnsureStartsTheThreeServicesOnceAndStoppingLeavesNothing)
{
    EnsureRequiredDaemons();
    const auto first = Statuses();
    for (const auto& [name, status] : first) {
        EXPECT_EQ(status.state, kServiceRunning) << name;
        EXPECT_TRUE(IsDaemonRunning(W(name))) << name;
    }
    EXPECT_EQ(ConnectAndGreet(), (std::vector<unsigned char>{0x20, 0x02, 0x00, 0x00})) << "CONNACK, accepted";
    const auto runtime = home_.Runtime() / "varoscope";
    EXPECT_TRUE(std::filesystem::exists(runtime / "classads.json"));
    EXPECT_TRUE(std::filesystem::exists(runtime / "timesync.json"));

    EnsureRequiredDaemons();
    const auto second = Statuses();
    for (const auto& [name, status] : first) {
        EXPECT_EQ(second.at(name).processId, status.processId) << name << " was started again";
        EXPECT_EQ(second.at(name).hostPid, status.hostPid) << name;
    }

    for (const std::string& name : RequiredServiceNames())
        StopDaemon(W(name), false, 10000);
    for (const auto& [name, status] : first) {
        EXPECT_FALSE(IsDaemonRunning(W(name))) << name;
        EXPECT_TRUE(WaitUntil([&] { return ProcessGone(status.processId) && ProcessGone(status.hostPid); },
                              milliseconds(2000)))
            << name;
    }
    EXPECT_EQ(Connect(), -1) << "the broker is gone";
    EXPECT_FALSE(std::filesystem::exists(runtime / "classads.json")) << "a stopped host withdraws its advertisement";
}
