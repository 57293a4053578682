// Storage of a block of raw bytes, reached through its byte interface.
// Blocks compare byte by byte, then by length; they read as a number and as
// a logical by their byte count.

#include "value/dynamic/DynamicData.h"
#include "value/dynamic/RefCounted.h"

#include <vector>

namespace qv::value::dynamic {
namespace {

class RawGuts final : public RefCounted<IGuts>, public IRawBytes {
public:
    RawGuts(const std::uint8_t* bytes, std::uint32_t count) : bytes_(bytes, bytes + count) {}

    std::uint32_t AddRef() override { return RefCounted::AddRef(); }
    std::uint32_t Release() override { return RefCounted::Release(); }
    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (iid == kIID_RawBytes)
            return Offer(static_cast<IRawBytes*>(this), out);
        return RefCounted::QueryInterface(iid, out);
    }
    bool ToBool() const override { return !bytes_.empty(); }
    double ToDouble() const override { return static_cast<double>(bytes_.size()); }
    int Compare(const IGuts* other) const override
    {
        const auto& those = static_cast<const RawGuts*>(static_cast<const RefCounted<IGuts>*>(other))->bytes_;
        if (bytes_ < those)
            return -1;
        return bytes_ == those ? 0 : 1;
    }
    bool GetBytes(const std::uint8_t** data, std::uint32_t* count) const override
    {
        *data = bytes_.data();
        *count = static_cast<std::uint32_t>(bytes_.size());
        return true;
    }

private:
    std::vector<std::uint8_t> bytes_;
};

} // namespace

IGuts* NewRawGuts(const std::uint8_t* bytes, std::uint32_t count)
{
    return static_cast<RefCounted<IGuts>*>(new RawGuts(bytes, count));
}

} // namespace qv::value::dynamic
