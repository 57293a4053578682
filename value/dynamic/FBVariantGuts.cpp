// Storage of a foreign variant: its type descriptor and flattened data,
// kept as given. Variants read as a number and as a logical through the
// value they hold (0 and false when they cannot be read), and compare by
// descriptor, then by data.

#include "value/VarData.h"
#include "value/dynamic/DynamicData.h"
#include "value/dynamic/RefCounted.h"
#include "value/wfstatic/FBVariantReader.h"

#include <vector>

namespace qv::value::dynamic {
namespace {

class FBVariantGuts final : public RefCounted<IFBVariantGuts> {
public:
    FBVariantGuts(const std::uint16_t* descriptor, std::uint16_t words, const std::uint8_t* data, std::uint32_t bytes)
        : descriptor_(descriptor, descriptor + words), data_(data, data + bytes)
    {
    }

    bool ToBool() const override { return Read().ToBool(); }
    double ToDouble() const override { return Read().ToDouble(); }
    int Compare(const IGuts* other) const override
    {
        const auto* that = static_cast<const FBVariantGuts*>(static_cast<const IFBVariantGuts*>(other));
        if (descriptor_ != that->descriptor_)
            return descriptor_ < that->descriptor_ ? -1 : 1;
        if (data_ != that->data_)
            return data_ < that->data_ ? -1 : 1;
        return 0;
    }
    void GetContents(const std::uint16_t** descriptor, std::uint16_t* words, const std::uint8_t** data,
                     std::uint32_t* bytes) const override
    {
        *descriptor = descriptor_.data();
        *words = static_cast<std::uint16_t>(descriptor_.size());
        *data = data_.data();
        *bytes = static_cast<std::uint32_t>(data_.size());
    }

private:
    VarData Read() const
    {
        try {
            return wfstatic::FBVariantToVarData(descriptor_.data(), descriptor_.data() + descriptor_.size(),
                                                data_.data(), data_.data() + data_.size());
        } catch (const std::exception&) {
            return VarData();
        }
    }

    std::vector<std::uint16_t> descriptor_;
    std::vector<std::uint8_t> data_;
};

} // namespace

IFBVariantGuts* NewVarDataFBVariant(const std::uint16_t* descriptor, std::uint16_t descriptorWords,
                                    const std::uint8_t* data, std::uint32_t dataBytes)
{
    return new FBVariantGuts(descriptor, descriptorWords, data, dataBytes);
}

} // namespace qv::value::dynamic
