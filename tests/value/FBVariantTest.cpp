#include "value/wfstatic/FBVariantReader.h"
#include "value/wfstatic/FBVariantWriter.h"

#include "fen/SyntaxError.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cmath>
#include <cstdio>
#include <iterator>
#include <limits>
#include <random>
#include <string>
#include <utility>
#include <vector>

using qv::fen::AbsTime;
using qv::fen::exception::BufferOverflow;
using qv::fen::exception::SyntaxError;
using qv::fen::exception::UnableToConvert;
using qv::value::NumericKind;
using qv::value::VarData;
namespace TypeCode = qv::value::TypeCode;
namespace wfstatic = qv::value::wfstatic;

namespace {

using Words = std::vector<std::uint16_t>;
using Bytes = std::vector<std::uint8_t>;

struct Flat {
    Words descriptor;
    Bytes data;
};

/// Both passes, with buffers of exactly the measured sizes.
Flat Write(const VarData& value)
{
    const wfstatic::FBVariantSizes sizes = wfstatic::MeasureFBVariant(value);
    Flat flat{Words(sizes.descriptorWords, 0), Bytes(sizes.dataBytes, 0)};
    wfstatic::WriteFBVariant(value, flat.descriptor.data(), sizes.descriptorWords, flat.data.data(), sizes.dataBytes);
    return flat;
}

VarData Read(const Words& descriptor, const Bytes& data)
{
    return wfstatic::FBVariantToVarData(descriptor.data(), descriptor.data() + descriptor.size(), data.data(),
                                        data.data() + data.size());
}

/// A text that tells values apart by type word and content, nested vectors included.
std::string Describe(const VarData& value)
{
    std::string text = std::to_string(value.TypeWord()) + ":";
    double number = 0;
    bool logical = false;
    AbsTime time{};
    if (value.GetDouble(number)) {
        char digits[40];
        std::snprintf(digits, sizeof digits, "%.17g", number);
        return text + digits;
    }
    if (value.GetBool(logical))
        return text + (logical ? "true" : "false");
    if (value.GetTime(time))
        return text + std::to_string(time.seconds) + "/" + std::to_string(time.fraction);
    if (value.Code() == TypeCode::AnsiString)
        return text + "'" + std::string(value.GetString().View()) + "'";
    if (value.Code() == TypeCode::Vector) {
        for (std::uint32_t i = 0; i < value.Size(); ++i)
            text += (i == 0 ? "[" : ",") + Describe(value.GetElement(i));
        return text + "]";
    }
    return text;
}

VarData VectorOf(std::initializer_list<VarData> elements)
{
    VarData vector;
    std::uint32_t i = 0;
    for (const VarData& element : elements)
        vector.SetElement(i++, element);
    return vector;
}

VarData Number(double value, NumericKind kind)
{
    return VarData::MakeNumeric(value, static_cast<std::uint16_t>(kind));
}

/// Runs `action` and expects it to throw E stamped with `source`.
template <typename E, typename Action>
void ExpectFailure(Action action, const char* source)
{
    try {
        action();
        ADD_FAILURE() << "no exception";
    } catch (const E& e) {
        EXPECT_STREQ(e.GetFile(), source);
    }
}

template <typename E>
void ExpectReadFails(const Words& descriptor, const Bytes& data)
{
    ExpectFailure<E>([&] { Read(descriptor, data); }, "wfstatic\\FBVariantToVarData");
}

template <typename E>
void ExpectWriteFails(const VarData& value)
{
    ExpectFailure<E>([&] { Write(value); }, "wfstatic\\VarDataToFBVariant");
}

} // namespace

TEST(FBVariantReader, ReadsEachTypeAndSkipsNames)
{
    EXPECT_EQ(Describe(Read({4, 0x03}, {0xFF, 0xFF, 0xFF, 0xFE})), Describe(Number(-2, NumericKind::Int32)));
    EXPECT_EQ(Describe(Read({4, 0x01}, {0x80})), Describe(Number(-128, NumericKind::Int8)));
    EXPECT_EQ(Describe(Read({4, 0x09}, {0x3F, 0xC0, 0, 0})), Describe(Number(1.5, NumericKind::Float32)));
    EXPECT_EQ(Describe(Read({8, 0x30, 0xFFFF, 0xFFFF}, {0, 0, 0, 2, 'A', 'B'})), Describe(VarData("AB")));
    EXPECT_EQ(Describe(Read({4, 0x21}, {0x02})), Describe(VarData::MakeLogical(true)));
    EXPECT_EQ(Read({4, 0x00}, {}).Code(), TypeCode::Null);
    EXPECT_EQ(Describe(Read({4, 0x54}, {0x80, 0, 0, 0, 0, 0, 0, 1, 0xC0, 0, 0, 0, 0, 0, 0, 3})),
              Describe(VarData(AbsTime{0xC000000000000003u, std::numeric_limits<std::int64_t>::min() + 1})));
    EXPECT_EQ(Read({14, 0x40, 1, 0xFFFF, 0xFFFF, 4, 0x03}, {0, 0, 0, 0}).Code(), TypeCode::Null);

    // Named "ab": the length byte and two characters, padded to two words;
    // also with a size that leaves the padding byte out.
    EXPECT_EQ(Describe(Read({8, 0x4003, 0x0261, 0x6200}, {0, 0, 0, 7})), Describe(Number(7, NumericKind::Int32)));
    EXPECT_EQ(Describe(Read({7, 0x4003, 0x0261, 0x6200}, {0, 0, 0, 7})), Describe(Number(7, NumericKind::Int32)));
    // An array named "arr" of strings named "x".
    const Words named = {24, 0x4040, 1, 0xFFFF, 0xFFFF, 10, 0x4030, 0xFFFF, 0xFFFF, 0x0178, 0x0361, 0x7272};
    EXPECT_EQ(Describe(Read(named, {0, 0, 0, 2, 0, 0, 0, 1, 'A', 0, 0, 0, 2, 'B', 'C'})),
              Describe(VectorOf({"A", "BC"})));
    EXPECT_EQ(Read(named, {0, 0, 0, 0}).Code(), TypeCode::Null);
}

TEST(FBVariantReader, MalformedInputFailsWithTheRightClass)
{
    ExpectReadFails<SyntaxError>({}, {});
    ExpectReadFails<SyntaxError>({0, 0x03}, {0, 0, 0, 1});                   // size 0
    ExpectReadFails<SyntaxError>({6, 0x03}, {0, 0, 0, 1});                   // past the descriptor
    ExpectReadFails<SyntaxError>({2, 0x03}, {0, 0, 0, 1});                   // before the type word
    ExpectReadFails<SyntaxError>({8, 0x4003, 0x0561, 0x6200}, {0, 0, 0, 7}); // name past its element
    ExpectReadFails<SyntaxError>({4, 0x03}, {0, 0, 1});
    ExpectReadFails<SyntaxError>({8, 0x30, 0xFFFF, 0xFFFF}, {0, 0, 0, 3, 'A', 'B'});
    ExpectReadFails<UnableToConvert>({8, 0x30, 0x0002, 0xFFFF}, {0, 0, 0, 0});
    ExpectReadFails<UnableToConvert>({18, 0x40, 2, 0xFFFF, 0xFFFF, 0xFFFF, 0xFFFF, 4, 0x03}, {0, 0, 0, 1});
    ExpectReadFails<UnableToConvert>({4, 0x50}, {});
    ExpectReadFails<UnableToConvert>({4, 0x04}, {0, 0, 0, 0, 0, 0, 0, 0});

    // Counts that the data cannot hold fail before anything is built.
    ExpectReadFails<SyntaxError>({14, 0x40, 1, 0xFFFF, 0xFFFF, 4, 0x07}, {0xFF, 0xFF, 0xFF, 0xFF, 0, 0, 0, 1});
    ExpectReadFails<SyntaxError>({18, 0x40, 1, 0xFFFF, 0xFFFF, 8, 0x30, 0xFFFF, 0xFFFF},
                                 {0xFF, 0xFF, 0xFF, 0xFF, 0, 0, 0, 0});
    ExpectReadFails<UnableToConvert>({14, 0x40, 1, 0xFFFF, 0xFFFF, 4, 0x00}, {0xFF, 0xFF, 0xFF, 0xFF});
    EXPECT_EQ(Read({14, 0x40, 1, 0xFFFF, 0xFFFF, 4, 0x00}, {0, 0, 0, 3}).Size(), 3u);
}

TEST(FBVariant, ArraysNest64DeepOnBothSides)
{
    VarData deep = Number(1, NumericKind::Float64);
    for (int level = 0; level < 64; ++level)
        deep = VectorOf({deep});
    Flat flat = Write(deep);
    EXPECT_EQ(Describe(Read(flat.descriptor, flat.data)), Describe(deep));

    ExpectWriteFails<UnableToConvert>(VectorOf({deep}));
    const auto size = static_cast<std::uint16_t>(flat.descriptor[0] + 10);
    flat.descriptor.insert(flat.descriptor.begin(), {size, 0x40, 1, 0xFFFF, 0xFFFF});
    flat.data.insert(flat.data.begin(), {0, 0, 0, 1});
    ExpectReadFails<SyntaxError>(flat.descriptor, flat.data);
}

TEST(FBVariantWriter, GoldenBytes)
{
    auto expectWrites = [](const VarData& value, const Words& descriptor, const Bytes& data) {
        const Flat flat = Write(value);
        EXPECT_EQ(flat.descriptor, descriptor);
        EXPECT_EQ(flat.data, data);
    };
    expectWrites(VarData::MakeBitField(0xDEADBEEF), {4, 0x07}, {0xDE, 0xAD, 0xBE, 0xEF});
    expectWrites(VarData("AB"), {8, 0x30, 0xFFFF, 0xFFFF}, {0, 0, 0, 2, 'A', 'B'});
    expectWrites(VectorOf({Number(1, NumericKind::UInt16), Number(2, NumericKind::UInt16)}),
                 {14, 0x40, 1, 0xFFFF, 0xFFFF, 4, 0x06}, {0, 0, 0, 2, 0, 1, 0, 2});
    expectWrites(VarData(AbsTime{0x090A0B0C0D0E0F10u, 0x0102030405060708}), {4, 0x54},
                 {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16});
}

TEST(FBVariantWriter, RefusesWhatCannotBeFlattenedAndSmallBuffers)
{
    ExpectWriteFails<UnableToConvert>(VectorOf({Number(1, NumericKind::Float64), VarData::MakeLogical(true)}));
    ExpectWriteFails<UnableToConvert>(VectorOf({VectorOf({Number(1, NumericKind::Int8)}), VectorOf({"x"})}));
    ExpectWriteFails<UnableToConvert>(VarData::MakeTyped(TypeCode::Vector));
    ExpectWriteFails<UnableToConvert>(VarData::NewDictionary());
    ExpectWriteFails<UnableToConvert>(VarData::MakeNumeric(1, 9));
    VarData gapped = Number(1, NumericKind::Float64); // element 1 stays Empty
    gapped.SetElement(2, Number(2, NumericKind::Float64));
    ExpectWriteFails<UnableToConvert>(gapped);

    const VarData value = VectorOf({"abc", "de"});
    const wfstatic::FBVariantSizes sizes = wfstatic::MeasureFBVariant(value);
    Words descriptor(sizes.descriptorWords);
    Bytes data(sizes.dataBytes);
    EXPECT_THROW(wfstatic::WriteFBVariant(value, descriptor.data(), sizes.descriptorWords - 1, data.data(), 99),
                 BufferOverflow);
    EXPECT_THROW(wfstatic::WriteFBVariant(value, descriptor.data(), 99, data.data(), sizes.dataBytes - 1),
                 BufferOverflow);
}

TEST(FBVariant, WrittenValuesReadBack)
{
    const std::uint8_t raw[] = {'r', 'a', 'w'};
    const std::pair<VarData, VarData> rows[] = {
        {VarData::MakeTyped(TypeCode::Null), VarData::MakeTyped(TypeCode::Null)},
        {VarData::MakeLogical(true), VarData::MakeLogical(true)},
        {Number(-2147483648.0, NumericKind::Int32), Number(-2147483648.0, NumericKind::Int32)},
        {Number(-0.1f, NumericKind::Float32), Number(-0.1f, NumericKind::Float32)},
        {VarData::MakeBitField(0xDEADBEEF), Number(0xDEADBEEF, NumericKind::UInt32)},
        // Out-of-range numbers saturate, fractions are dropped, NaN writes 0.
        {Number(300.7, NumericKind::Int8), Number(127, NumericKind::Int8)},
        {Number(-7.9, NumericKind::Int32), Number(-7, NumericKind::Int32)},
        {Number(NAN, NumericKind::UInt16), Number(0, NumericKind::UInt16)},
        {VarData::MakeAnsi("a\0b", 3), VarData::MakeAnsi("a\0b", 3)},
        {VarData(u"wide"), VarData("wide")},
        {VarData(raw, 3), VarData("raw")},
        {VectorOf({VectorOf({"x", "yz"}), VectorOf({""})}), VectorOf({VectorOf({"x", "yz"}), VectorOf({""})})},
    };
    for (const auto& [written, expected] : rows) {
        const Flat flat = Write(written);
        EXPECT_EQ(Describe(Read(flat.descriptor, flat.data)), Describe(expected));
    }
}

// Mutations of valid pairs must come out as a value or as one of the two
// failures, never as a crash, a read outside the buffers or another class.
TEST(FBVariantReader, MutatedInputOnlyFailsCleanly)
{
    const Flat seeds[] = {
        Write(VectorOf({VectorOf({Number(1, NumericKind::Int16)}), VectorOf({Number(2, NumericKind::Int16)})})),
        Write(VectorOf({VarData(AbsTime{1, 2}), VarData(AbsTime{3, 4})})),
        Write(VectorOf({"abc", "", "de"})),
        {{24, 0x4040, 1, 0xFFFF, 0xFFFF, 10, 0x4030, 0xFFFF, 0xFFFF, 0x0178, 0x0361, 0x7272},
         {0, 0, 0, 2, 0, 0, 0, 1, 'A', 0, 0, 0, 2, 'B', 'C'}},
        {{14, 0x40, 1, 0xFFFF, 0xFFFF, 4, 0x00}, {0, 0, 0, 3}},
    };
    std::mt19937 random(20240611);
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(5);
    for (int reads = 0; reads < 100000 && std::chrono::steady_clock::now() < deadline; ++reads) {
        Flat flat = seeds[random() % std::size(seeds)];
        for (int changes = 1 + random() % 3; changes > 0; --changes) {
            Words& words = flat.descriptor;
            Bytes& bytes = flat.data;
            switch (random() % 4) {
            case 0: if (!words.empty()) words[random() % words.size()] = static_cast<std::uint16_t>(random()); break;
            case 1: if (!bytes.empty()) bytes[random() % bytes.size()] = static_cast<std::uint8_t>(random()); break;
            case 2: words.resize(random() % (words.size() + 1)); break;
            default: bytes.resize(random() % (bytes.size() + 1)); break;
            }
        }
        try {
            // Copies hold exactly their elements, so the address sanitizer sees
            // a read past either end.
            Read(Words(flat.descriptor), Bytes(flat.data));
        } catch (const SyntaxError&) {
        } catch (const UnableToConvert&) {
        } catch (const std::exception& e) {
            FAIL() << "unexpected " << e.what();
        }
    }
}
