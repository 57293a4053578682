#pragma once
/// \file
/// Keys of the registry store, the program's settings database: one
/// human-readable file per root key in the configuration directory, shared
/// safely by every process of the user.
///
/// Key paths are backslash-separated and, like value names, compared without
/// regard to letter case. Every failure of the store is a WinError carrying
/// the Win32-equivalent code: 2 for a key or value that does not exist, 5
/// for writing through a read-only key, 53 for a remote machine (the store
/// is local only), 161 for a key path with an empty or unprintable name,
/// 1009 for a store file that cannot be read, 1018 for a key deleted since
/// it was opened.

#include "fen/Noncopyable.h"
#include "fen/String.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace qv::fen::osdep {

/// Root codes of RegKey.
inline constexpr std::uint32_t kCurrentUser = 0;
inline constexpr std::uint32_t kLocalMachine = 1;
inline constexpr std::uint32_t kClassesRoot = 2;
inline constexpr std::uint32_t kUsers = 3;
/// The local machine's 32-bit and 64-bit views; both are the one store.
inline constexpr std::uint32_t kLocalMachine32 = 4;
inline constexpr std::uint32_t kLocalMachine64 = 5;

/// Value types.
inline constexpr std::uint32_t kRegNone = 0;
inline constexpr std::uint32_t kRegSz = 1;
inline constexpr std::uint32_t kRegExpandSz = 2;
inline constexpr std::uint32_t kRegBinary = 3;
inline constexpr std::uint32_t kRegDword = 4;
inline constexpr std::uint32_t kRegMultiSz = 7;
inline constexpr std::uint32_t kRegQword = 11;

/// Access rights a key is opened with.
inline constexpr std::uint32_t kReadAccess = 0x20009;
inline constexpr std::uint32_t kWriteAccess = 0x2000F;
inline constexpr std::uint32_t kWow64_32Key = 0x200;
inline constexpr std::uint32_t kWow64_64Key = 0x100;

/// The prefix below which subkeys are opened unless the caller gives one.
inline constexpr char16_t kDefaultKeyPrefix[] = u"Software\\Quorvane\\";

/// One stored value: its type and its data. Strings (kRegSz, kRegExpandSz)
/// and string lists (kRegMultiSz) are held as text, numbers (kRegDword,
/// kRegQword) as a number, anything else as bytes.
struct RegValue {
    std::uint32_t type = kRegNone;
    std::u16string text;              ///< kRegSz, kRegExpandSz
    std::vector<std::u16string> list; ///< kRegMultiSz
    std::uint64_t number = 0;         ///< kRegDword, kRegQword
    std::vector<std::uint8_t> bytes;  ///< every other type

    friend bool operator==(const RegValue&, const RegValue&) = default;
};

/// An open key of the registry store.
class RegKey : private Noncopyable {
public:
    /// Opens (or with `create`, creates) `prefix` + `subkey` below the root
    /// `rootCode`; a null prefix means kDefaultKeyPrefix and an empty one the
    /// path as given. `readOnly` without `create` opens with kReadAccess,
    /// anything else with kWriteAccess (plus the view flag of roots 4 and 5).
    /// A non-empty `machine` names a remote machine and fails with WinError
    /// 53; a missing key fails with WinError 2.
    RegKey(std::uint32_t rootCode, const WString& subkey, bool readOnly = true, bool create = false,
           const char16_t* prefix = nullptr, const char16_t* machine = nullptr);
    ~RegKey();

    /// The string value `name` (kRegSz or kRegExpandSz, unexpanded, up to its
    /// first NUL). A missing value throws WinError 2, another type
    /// InvalidOperation.
    WString GetStringValue(const WString& name) const;
    /// As above, but when `throwOnError` is false any failure gives
    /// `defaultValue` (the empty text when it is null).
    WString GetStringValue(const WString& name, const WString* defaultValue, bool throwOnError) const;

    /// The value `name` of any type, or nothing when it is absent.
    std::optional<RegValue> GetValue(const WString& name) const;
    /// Stores `value` under `name`; needs write access.
    void SetValue(const WString& name, const RegValue& value);
    /// Stores a kRegSz (or, with `expand`, kRegExpandSz) value.
    void SetStringValue(const WString& name, const WString& value, bool expand = false);
    /// Removes the value `name`; a missing value throws WinError 2.
    void DeleteValue(const WString& name);
    /// Names of the values, in stored order.
    std::vector<WString> EnumerateValues() const;

    /// Names of the direct subkeys, in stored order.
    std::vector<WString> EnumerateSubkeys() const;
    /// Removes the subkey `name` with everything below it; a missing subkey
    /// throws WinError 2. Needs write access.
    void DeleteSubkey(const WString& name);

    /// The access rights the key was opened with.
    std::uint32_t GetAccess() const noexcept { return access_; }
    /// The root code and the full path of the key below its root.
    std::uint32_t GetRootCode() const noexcept { return rootCode_; }
    const WString& GetPath() const noexcept { return path_; }

private:
    std::uint32_t rootCode_;
    WString path_;
    std::uint32_t access_;
    std::string storeFile_; ///< the store file of the root, fixed when the key is opened
};

} // namespace qv::fen::osdep
