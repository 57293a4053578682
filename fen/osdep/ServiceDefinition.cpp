#include "fen/osdep/ServiceDefinition.h"

#include "fen/osdep/OSException.h"
#include "fen/osdep/RegKey.h"
#include "fen/osdep/ServiceRuntime.h"
#include "fen/osdep/TextConversion.h"

#include <strings.h>

namespace qv::fen::osdep {
namespace {

constexpr char16_t kServicesKey[] = u"SYSTEM\\CurrentControlSet\\Services";

std::u16string U16(const std::string& text)
{
    const WString wide = WideName(text);
    return std::u16string(wide.View());
}

std::string U8(const std::u16string& text) { return NarrowName(WString(std::u16string_view(text))); }

ServiceDefinition DefaultDefinition(const std::string& name)
{
    ServiceDefinition d;
    d.name = name;
    if (name == "WfClassAds") {
        d.displayName = "Orvek Host Advertiser";
        d.imagePath = "\"${VAROSCOPE_BIN_DIR}/wfclassads\"";
    } else if (name == "WfTimeSync") {
        d.displayName = "Orvek Time Synchronisation Monitor";
        d.imagePath = "\"${VAROSCOPE_BIN_DIR}/wftimesync\"";
    } else {
        d.displayName = "Orvek Data Server";
        d.imagePath = "\"${VAROSCOPE_BIN_DIR}/wfcairnet\"";
        d.waitHint = 10000;
    }
    return d;
}

WString ServiceKeyPath(const std::string& name) { return WString(kServicesKey) + u"\\" + WideName(name); }

/// The stored spelling of `name`, found without regard to case; the name
/// itself when nothing matches.
std::string StoredSpelling(const std::string& name)
{
    for (const std::string& stored : ListServiceNames())
        if (::strcasecmp(stored.c_str(), name.c_str()) == 0)
            return stored;
    return name;
}

std::optional<ServiceDefinition> Read(const std::string& name)
{
    std::optional<RegKey> key;
    try {
        key.emplace(kLocalMachine, ServiceKeyPath(name), true, false, u"");
    } catch (const WinError& e) {
        if (e.GetOSErrorCode() == 2)
            return std::nullopt;
        throw;
    }
    const auto image = key->GetValue(u"ImagePath");
    if (!image || (image->type != kRegSz && image->type != kRegExpandSz))
        return std::nullopt;
    ServiceDefinition d;
    d.name = name;
    d.imagePath = U8(image->text);
    if (auto display = key->GetValue(u"DisplayName"); display && display->type == kRegSz)
        d.displayName = U8(display->text);
    if (auto depends = key->GetValue(u"DependOnService"); depends && depends->type == kRegMultiSz)
        for (const std::u16string& entry : depends->list)
            if (!entry.empty())
                d.dependOnService.push_back(U8(entry));
    if (auto hint = key->GetValue(u"WaitHint"); hint && hint->type == kRegDword)
        d.waitHint = static_cast<std::uint32_t>(hint->number);
    return d;
}

} // namespace

std::string NarrowName(const WString& name) { return ToAnsi(name).c_str(); }
WString WideName(const std::string& name) { return ToWide(String(name.c_str())); }

const std::vector<std::string>& RequiredServiceNames()
{
    static const std::vector<std::string> names{"WfClassAds", "WfTimeSync", "WfCairnetServer"};
    return names;
}

std::optional<ServiceDefinition> LoadServiceDefinition(const std::string& requested)
{
    if (!IsValidServiceName(requested))
        return std::nullopt;
    const std::string name = StoredSpelling(requested);
    if (auto found = Read(name))
        return found;
    for (const std::string& required : RequiredServiceNames()) {
        if (::strcasecmp(required.c_str(), name.c_str()) == 0) {
            WriteServiceDefinition(DefaultDefinition(required));
            return Read(StoredSpelling(required));
        }
    }
    return std::nullopt;
}

void WriteServiceDefinition(const ServiceDefinition& d)
{
    RegKey key(kLocalMachine, ServiceKeyPath(d.name), false, true, u"");
    RegValue image;
    image.type = kRegExpandSz;
    image.text = U16(d.imagePath);
    key.SetValue(u"ImagePath", image);
    key.SetStringValue(u"DisplayName", WideName(d.displayName));
    RegValue depends;
    depends.type = kRegMultiSz;
    for (const std::string& entry : d.dependOnService)
        depends.list.push_back(U16(entry));
    key.SetValue(u"DependOnService", depends);
    RegValue hint;
    hint.type = kRegDword;
    hint.number = d.waitHint;
    key.SetValue(u"WaitHint", hint);
}

std::vector<std::string> ListServiceNames()
{
    std::vector<std::string> names;
    std::optional<RegKey> services;
    try {
        services.emplace(kLocalMachine, WString(kServicesKey), true, false, u"");
    } catch (const WinError& e) {
        if (e.GetOSErrorCode() == 2)
            return names;
        throw;
    }
    for (const WString& subkey : services->EnumerateSubkeys()) {
        std::string name = NarrowName(subkey);
        if (IsValidServiceName(name) && Read(name))
            names.push_back(std::move(name));
    }
    return names;
}

std::vector<std::string> DependentServiceNames(const std::string& name)
{
    std::vector<std::string> dependents;
    for (const std::string& candidate : ListServiceNames()) {
        const auto d = Read(candidate);
        if (!d)
            continue;
        for (const std::string& dependency : d->dependOnService)
            if (::strcasecmp(dependency.c_str(), name.c_str()) == 0) {
                dependents.push_back(candidate);
                break;
            }
    }
    return dependents;
}

} // namespace qv::fen::osdep
