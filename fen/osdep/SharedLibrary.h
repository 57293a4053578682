#pragma once
/// \file
/// A shared library loaded at run time, and the lookup of its symbols.

#include "fen/String.h"

#include <cstdint>

namespace qv::fen::osdep {

/// A library opened with dlopen. A name without a file extension gets
/// ".so" appended, so "mpr" loads "mpr.so".
class SharedLibrary {
public:
    /// Loads `name` (normalised, see NormalizeName) unless it is empty. A
    /// failed load is not reported here: the library is then not loaded and
    /// GetSymbol says so. With `ownsModule` the destructor unloads it.
    /// `alteredSearchPath` resolves the library's own dependencies eagerly.
    explicit SharedLibrary(const WString& name, bool ownsModule = true, bool alteredSearchPath = false);
    virtual ~SharedLibrary();
    SharedLibrary(const SharedLibrary&) = delete;
    SharedLibrary& operator=(const SharedLibrary&) = delete;

    /// Loads the library again; returns the module or null (also for an
    /// empty name).
    virtual void* Load();
    /// Unloads a loaded library.
    virtual void Unload();

    /// The address of `name`. A missing symbol throws WinError 127 with the
    /// loader's text unless `optional`; without a loaded library it throws
    /// WinError 9999 "library not loaded" unless `optional`. With `optional`
    /// a failure gives null.
    void* GetSymbol(const char* name, bool optional = false) const;
    /// The same with a 16-bit name, converted through the system code page.
    void* GetSymbol(const WString& name, bool optional = false) const;

    const WString& GetPath() const noexcept { return path_; }
    void* GetModule() const noexcept { return module_; }

    /// The name as it is loaded: the empty name stays empty; a name whose
    /// file part (after the last slash or backslash) is not empty and has no
    /// full stop gets ".so" appended; anything else stays as given.
    static WString NormalizeName(const WString& name);

private:
    WString path_;
    void* module_ = nullptr;
    std::uint8_t ownsModule_;
    std::uint8_t alteredSearchPath_;
};

} // namespace qv::fen::osdep
