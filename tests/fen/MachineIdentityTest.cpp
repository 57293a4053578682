#include "fen/osdep/MachineIdentity.h"
#include "fen/osdep/RegKey.h"
#include "support/TemporaryHome.h"

#include <gtest/gtest.h>
#include <thread>
#include <vector>

using namespace qv::fen;
using namespace qv::fen::osdep;

namespace {

// Host names as a test wants them; nothing set means that call fails.
struct FakeHostNames : HostNameSource {
    std::optional<std::string> host;
    std::optional<std::string> computer;
    std::optional<std::string> domain;
    std::optional<std::string> HostName() const override { return host; }
    std::optional<std::string> ComputerName() const override { return computer; }
    std::optional<std::string> ResolverDomain() const override { return domain; }
};

class MachineIdentity : public ::testing::Test {
protected:
    MachineIdentity() : fake_(std::make_shared<FakeHostNames>()) { previous_ = SetHostNameSource(fake_); }
    ~MachineIdentity() override { SetHostNameSource(previous_); }

    FakeHostNames& Names() { return *fake_; }

    static void SetMachineName(const char16_t* name)
    {
        RegKey(kLocalMachine, WString(u"Orvek"), false, true).SetStringValue(WString(u"MachineName"), WString(name));
    }
    static void SetDomain(const char16_t* domain)
    {
        RegKey(kLocalMachine, WString(u"SYSTEM\\CurrentControlSet\\Services\\Tcpip\\Parameters"), false, true, u"")
            .SetStringValue(WString(u"Domain"), WString(domain));
    }

private:
    qv::test::TemporaryHome home_;
    std::shared_ptr<FakeHostNames> fake_;
    std::shared_ptr<const HostNameSource> previous_;
};

} // namespace

TEST_F(MachineIdentity, DomainRules)
{
    Names().domain = "resolver.example";
    EXPECT_EQ(CompleteWithDomain(WString(u"h")).View(), u"h.resolver.example");
    EXPECT_EQ(CompleteWithDomain(WString(u"h.already")).View(), u"h.already");
    SetDomain(u".lead.example");
    EXPECT_EQ(CompleteWithDomain(WString(u"h")).View(), u"h.lead.example");
    SetDomain(u"");
    EXPECT_EQ(CompleteWithDomain(WString(u"h")).View(), u"h.");
    Names().domain.reset();
    SetDomain(u"store.example");
    EXPECT_EQ(CompleteWithDomain(WString(u"h")).View(), u"h.store.example");
}

TEST_F(MachineIdentity, HostNameFallbacksAndTheConfiguredNameWins)
{
    Names().host = "  box17 extra";
    Names().computer = "NODE";
    Names().domain = "site.example";
    EXPECT_EQ(GetLocalHostName(false).View(), u"box17");
    EXPECT_EQ(GetLocalHostName(true).View(), u"box17.site.example");

    Names().host.reset(); // gethostname fails: the node name, never completed
    EXPECT_EQ(GetLocalHostName(true).View(), u"NODE");

    Names().computer.reset();
    EXPECT_EQ(GetLocalHostName(true).View(), u"localhost");
    Names().host = "   ";
    EXPECT_EQ(GetLocalHostName(false).View(), u"localhost");

    // A configured name wins over the host name.
    Names().host = "box17";
    SetMachineName(u"plant-a");
    EXPECT_EQ(GetLocalHostName(false).View(), u"plant-a");
    SetDomain(u"works.example");
    EXPECT_EQ(GetLocalHostName(true).View(), u"plant-a.works.example");
    SetMachineName(u"");
    EXPECT_EQ(GetLocalHostName(false).View(), u""); // present, so used even when empty
}

TEST_F(MachineIdentity, CachedNameIsComputedOnceForAllThreads)
{
    ResetCachedLocalHostNameForTesting();
    Names().host = "first";
    std::vector<std::thread> threads;
    std::vector<std::u16string> seen(8);
    for (std::size_t i = 0; i < seen.size(); ++i)
        threads.emplace_back([&seen, i] { seen[i] = std::u16string(GetCachedLocalHostName().View()); });
    for (std::thread& thread : threads)
        thread.join();
    Names().host = "second";
    EXPECT_EQ(GetCachedLocalHostName().View(), u"first");
    for (const std::u16string& name : seen)
        EXPECT_EQ(name, u"first");
    ResetCachedLocalHostNameForTesting();
}

TEST(MachineIdentitySystem, RealHostNameIsNotEmpty)
{
    qv::test::TemporaryHome home;
    EXPECT_FALSE(GetLocalHostName(false).empty());
}
