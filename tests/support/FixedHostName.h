#pragma once
// Gives this machine a fixed network name for the life of the object, so
// that tests of "localhost" rewriting do not depend on the machine's name.

#include "fen/osdep/MachineIdentity.h"

#include <memory>
#include <optional>
#include <string>
#include <utility>

namespace qv::test {

class FixedHostName {
public:
    explicit FixedHostName(std::string name)
        : previous_(fen::osdep::SetHostNameSource(std::make_shared<Source>(std::move(name))))
    {
        fen::osdep::ResetCachedLocalHostNameForTesting();
    }
    ~FixedHostName()
    {
        fen::osdep::SetHostNameSource(previous_);
        fen::osdep::ResetCachedLocalHostNameForTesting();
    }
    FixedHostName(const FixedHostName&) = delete;
    FixedHostName& operator=(const FixedHostName&) = delete;

private:
    class Source final : public fen::osdep::HostNameSource {
    public:
        explicit Source(std::string name) : name_(std::move(name)) {}
        std::optional<std::string> HostName() const override { return name_; }
        std::optional<std::string> ResolverDomain() const override { return std::nullopt; }

    private:
        std::string name_;
    };
    std::shared_ptr<const fen::osdep::HostNameSource> previous_;
};

} // namespace qv::test
