#include "value/StringCache.h"

#include "fen/TaskAllocator.h"

#include <algorithm>

namespace qv::value {
namespace {

// The first load uses this size; a text that fills the buffer to its last
// byte may have been cut, so the buffer grows by the same step and the text
// is loaded again.
constexpr std::size_t kLoadStep = 256;

// A task-allocator block freed on every exit.
class LoadBuffer {
public:
    LoadBuffer() = default;
    LoadBuffer(const LoadBuffer&) = delete;
    LoadBuffer& operator=(const LoadBuffer&) = delete;
    ~LoadBuffer() { fen::TaskMemFree(data_); }

    void Resize(std::size_t size) { data_ = static_cast<char*>(fen::CheckedRealloc(data_, size)); }
    char* Data() const noexcept { return data_; }

private:
    char* data_ = nullptr;
};

const fen::String& EmptyText()
{
    static const fen::String empty;
    return empty;
}

} // namespace

const fen::String& StringCache::Get(std::uint32_t id)
{
    if (auto found = texts_.find(id); found != texts_.end())
        return found->second;

    LoadBuffer buffer;
    std::size_t size = kLoadStep;
    buffer.Resize(size);
    std::size_t length = module_.LoadString(id, buffer.Data(), size);
    if (length == 0)
        return EmptyText();
    while (length >= size - 1) {
        size += kLoadStep;
        buffer.Resize(size);
        length = module_.LoadString(id, buffer.Data(), size);
    }
    // Never trust a module to stay inside the buffer it was given.
    length = std::min(length, size - 1);
    return texts_.emplace(id, fen::String(buffer.Data(), length)).first->second;
}

} // namespace qv::value
