// Keys of the registry store. A key holds no open handle: it is its root's
// store file and its path, and every call reads the file afresh (or changes
// it under the store's lock), so changes made by other processes are seen at
// once. A key deleted after it was opened fails every later call with
// WinError 1018, as a deleted key's handle does.

#include "fen/osdep/RegKey.h"

#include "fen/osdep/OSException.h"
#include "fen/osdep/RegistryStore.h"
#include "fen/osdep/TextConversion.h"

#include <algorithm>

namespace qv::fen::osdep {
namespace {

using registry::StoredKey;

constexpr std::uint32_t kErrorNotFound = 2;
constexpr std::uint32_t kErrorAccessDenied = 5;
constexpr std::uint32_t kErrorBadNetPath = 53;
constexpr std::uint32_t kErrorInvalidParameter = 87;
constexpr std::uint32_t kErrorKeyDeleted = 1018;

std::u16string_view ViewOf(const WString& text) { return {text.c_str(), text.length()}; }
WString WStringOf(std::u16string_view text) { return WString(text.data(), text.size()); }

std::vector<std::u16string> SegmentsOf(const WString& path) { return registry::SplitKeyPath(ViewOf(path)); }

[[noreturn]] void Fail(std::uint32_t code, const std::string& what, std::uint32_t rootCode, const WString& path,
                       const WString* name = nullptr)
{
    std::string message = what + ": " + registry::RootName(rootCode);
    if (!path.empty())
        message += "\\" + std::string(ToAnsi(path).c_str());
    if (name != nullptr)
        message += " \"" + std::string(ToAnsi(*name).c_str()) + "\"";
    QV_THROW(WinError(String(message.c_str()), code));
}

/// A copy of `value` holding only the field its type uses.
RegValue Normalized(const RegValue& value)
{
    RegValue result;
    result.type = value.type;
    switch (value.type) {
    case kRegSz:
    case kRegExpandSz: result.text = value.text; break;
    case kRegMultiSz: result.list = value.list; break;
    case kRegDword:
    case kRegQword: result.number = value.number; break;
    default: result.bytes = value.bytes; break;
    }
    return result;
}

} // namespace

RegKey::RegKey(std::uint32_t rootCode, const WString& subkey, bool readOnly, bool create, const char16_t* prefix,
               const char16_t* machine)
    : rootCode_(rootCode), access_(readOnly && !create ? kReadAccess : kWriteAccess)
{
    // The store lives on this machine only; nothing is touched for a remote one.
    if (machine != nullptr && machine[0] != u'\0') {
        const std::string name(ToAnsi(WString(machine)).c_str());
        QV_THROW(WinError(String(("Cannot connect to the registry of the remote machine " + name +
                                  ": the registry store is local only").c_str()),
                          kErrorBadNetPath));
    }
    storeFile_ = registry::StoreFileOfRoot(rootCode);
    if (rootCode == kLocalMachine32)
        access_ |= kWow64_32Key;
    else if (rootCode == kLocalMachine64)
        access_ |= kWow64_64Key;

    const std::vector<std::u16string> segments =
        SegmentsOf(WString(prefix != nullptr ? prefix : kDefaultKeyPrefix) + subkey);
    for (const std::u16string& segment : segments) {
        if (!path_.empty())
            path_ += u"\\";
        path_ += WStringOf(segment);
    }

    if (create) {
        registry::ChangeStore(storeFile_, [&](StoredKey& root) {
            bool created = false;
            root.Obtain(segments, created);
            return created;
        });
    } else if (registry::ReadStore(storeFile_).Find(segments) == nullptr) {
        Fail(kErrorNotFound, "Registry key not found", rootCode_, path_);
    }
}

RegKey::~RegKey() = default;

namespace {

/// The key at `path` in `root`; a key deleted since it was opened fails.
template <typename Key>
Key& KeyIn(Key& root, std::uint32_t rootCode, const WString& path)
{
    Key* key = root.Find(SegmentsOf(path));
    if (key == nullptr)
        Fail(kErrorKeyDeleted, "Registry key has been deleted", rootCode, path);
    return *key;
}

} // namespace

WString RegKey::GetStringValue(const WString& name) const
{
    const StoredKey root = registry::ReadStore(storeFile_);
    const RegValue* value = KeyIn(root, rootCode_, path_).FindValue(ViewOf(name));
    if (value == nullptr)
        Fail(kErrorNotFound, "Registry value not found", rootCode_, path_, &name);
    if (value->type != kRegSz && value->type != kRegExpandSz)
        QV_THROW(exception::InvalidOperation());
    const std::u16string& text = value->text;
    return WStringOf(std::u16string_view(text).substr(0, text.find(u'\0')));
}

WString RegKey::GetStringValue(const WString& name, const WString* defaultValue, bool throwOnError) const
{
    try {
        return GetStringValue(name);
    } catch (const exception::Exception&) {
        if (throwOnError)
            throw;
        return defaultValue != nullptr ? *defaultValue : WString();
    }
}

std::optional<RegValue> RegKey::GetValue(const WString& name) const
{
    const StoredKey root = registry::ReadStore(storeFile_);
    if (const RegValue* value = KeyIn(root, rootCode_, path_).FindValue(ViewOf(name)))
        return *value;
    return std::nullopt;
}

void RegKey::SetValue(const WString& name, const RegValue& value)
{
    if ((access_ & kWriteAccess) != kWriteAccess)
        Fail(kErrorAccessDenied, "Registry key is open for reading only", rootCode_, path_);
    if (value.type == kRegDword && value.number > 0xFFFFFFFFu)
        Fail(kErrorInvalidParameter, "A DWORD value must fit in 32 bits", rootCode_, path_, &name);
    const RegValue stored = Normalized(value);
    registry::ChangeStore(storeFile_, [&](StoredKey& root) {
        return KeyIn(root, rootCode_, path_).SetValue(ViewOf(name), stored);
    });
}

void RegKey::SetStringValue(const WString& name, const WString& value, bool expand)
{
    RegValue stored;
    stored.type = expand ? kRegExpandSz : kRegSz;
    stored.text.assign(value.c_str(), value.length());
    SetValue(name, stored);
}

void RegKey::DeleteValue(const WString& name)
{
    if ((access_ & kWriteAccess) != kWriteAccess)
        Fail(kErrorAccessDenied, "Registry key is open for reading only", rootCode_, path_);
    registry::ChangeStore(storeFile_, [&](StoredKey& root) {
        if (!KeyIn(root, rootCode_, path_).RemoveValue(ViewOf(name)))
            Fail(kErrorNotFound, "Registry value not found", rootCode_, path_, &name);
        return true;
    });
}

std::vector<WString> RegKey::EnumerateValues() const
{
    const StoredKey root = registry::ReadStore(storeFile_);
    std::vector<WString> names;
    for (const registry::StoredValue& value : KeyIn(root, rootCode_, path_).Values())
        names.push_back(WStringOf(value.name));
    return names;
}

std::vector<WString> RegKey::EnumerateSubkeys() const
{
    const StoredKey root = registry::ReadStore(storeFile_);
    std::vector<WString> names;
    for (const StoredKey& subkey : KeyIn(root, rootCode_, path_).Subkeys())
        names.push_back(WStringOf(subkey.Name()));
    return names;
}

void RegKey::DeleteSubkey(const WString& name)
{
    if ((access_ & kWriteAccess) != kWriteAccess)
        Fail(kErrorAccessDenied, "Registry key is open for reading only", rootCode_, path_);
    // An empty name would mean this key itself; refusing it keeps a slip
    // from wiping a whole branch.
    std::vector<std::u16string> segments = SegmentsOf(name);
    if (segments.empty())
        Fail(kErrorInvalidParameter, "No subkey named for deletion", rootCode_, path_);
    const std::u16string last = segments.back();
    segments.pop_back();
    registry::ChangeStore(storeFile_, [&](StoredKey& root) {
        StoredKey* parent = KeyIn(root, rootCode_, path_).Find(segments);
        if (parent == nullptr || !parent->RemoveSubkey(last))
            Fail(kErrorNotFound, "Registry key not found", rootCode_, path_, &name);
        return true;
    });
}

} // namespace qv::fen::osdep
