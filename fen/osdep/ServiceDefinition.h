#pragma once
/// \file
/// Service definitions in the registry store, below the local machine's
/// "SYSTEM\CurrentControlSet\Services\<name>":
///   ImagePath        kRegExpandSz: the command line (ServiceCommandLine.h);
///                    the service host sets VAROSCOPE_BIN_DIR before expanding
///   DependOnService  kRegMultiSz: services that must run before this one
///   WaitHint         kRegDword: ms a start or stop may go without progress
///   DisplayName      kRegSz: the name shown to people
/// A key without an ImagePath is not a service (the store keeps other
/// settings below "Services" too). The three services the monitor needs are
/// defined with their defaults the first time they are looked up.

#include "fen/String.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace qv::fen::osdep {

inline constexpr std::uint32_t kDefaultWaitHintMs = 5000;

struct ServiceDefinition {
    std::string name; ///< as stored: the store ignores case, marks do not
    std::string displayName;
    std::string imagePath;
    std::vector<std::string> dependOnService;
    std::uint32_t waitHint = kDefaultWaitHintMs;
};

/// The services the monitor needs, in the order they are started.
const std::vector<std::string>& RequiredServiceNames();

/// The definition of `name`, or nothing when there is none (or the name is
/// invalid). A required service without one gets its default first. Store
/// failures throw WinError.
std::optional<ServiceDefinition> LoadServiceDefinition(const std::string& name);

/// Writes `definition` under its name, replacing the four values.
void WriteServiceDefinition(const ServiceDefinition& definition);

/// The defined services, in stored order.
std::vector<std::string> ListServiceNames();

/// The defined services whose DependOnService names `name`, in stored order.
std::vector<std::string> DependentServiceNames(const std::string& name);

/// Converts between the API's 16-bit names and the 8-bit names used here.
std::string NarrowName(const WString& name);
WString WideName(const std::string& name);

} // namespace qv::fen::osdep
