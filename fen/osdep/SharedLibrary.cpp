#include "fen/osdep/SharedLibrary.h"

#include "fen/osdep/OSException.h"

#include <dlfcn.h>

namespace qv::fen::osdep {
namespace {

constexpr std::uint32_t kProcNotFound = 127;
constexpr std::uint32_t kLibraryNotLoaded = 9999;

} // namespace

WString SharedLibrary::NormalizeName(const WString& name)
{
    if (name.empty())
        return name;
    std::size_t start = 0;
    for (std::size_t i = 0; i < name.length(); ++i)
        if (name[i] == u'\\' || name[i] == u'/')
            start = i + 1;
    const std::u16string_view filePart = name.View().substr(start);
    if (!filePart.empty() && filePart.find(u'.') == std::u16string_view::npos)
        return name + u".so";
    return name;
}

SharedLibrary::SharedLibrary(const WString& name, bool ownsModule, bool alteredSearchPath)
    : path_(NormalizeName(name)), ownsModule_(ownsModule ? 1 : 0), alteredSearchPath_(alteredSearchPath ? 1 : 0)
{
    Load();
}

SharedLibrary::~SharedLibrary()
{
    if (ownsModule_ != 0)
        Unload();
}

void* SharedLibrary::Load()
{
    if (path_.empty())
        return nullptr;
    const String path(path_);
    void* module = dlopen(path.c_str(), (alteredSearchPath_ != 0 ? RTLD_NOW : RTLD_LAZY) | RTLD_LOCAL);
    if (module != nullptr && module_ != nullptr)
        dlclose(module_); // keep one reference per object
    if (module != nullptr)
        module_ = module;
    return module;
}

void SharedLibrary::Unload()
{
    if (module_ != nullptr) {
        dlclose(module_);
        module_ = nullptr;
    }
}

void* SharedLibrary::GetSymbol(const char* name, bool optional) const
{
    if (module_ == nullptr) {
        if (optional)
            return nullptr;
        QV_THROW(WinError(String("library not loaded"), kLibraryNotLoaded));
    }
    dlerror(); // clear an older error
    void* symbol = dlsym(module_, name);
    if (symbol == nullptr && !optional) {
        const char* why = dlerror();
        QV_THROW(WinError(String(why != nullptr ? why : "symbol not found"), kProcNotFound));
    }
    return symbol;
}

void* SharedLibrary::GetSymbol(const WString& name, bool optional) const
{
    return GetSymbol(String(name).c_str(), optional);
}

} // namespace qv::fen::osdep
