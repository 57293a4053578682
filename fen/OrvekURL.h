#pragma once
/// \file
/// The address of an item on the network: a host, a process on that host
/// and a path inside the process, written with backslashes, as in
/// \\host\process\folder.variable.
///
/// Text is 16-bit; characters are compared as code units and letter case is
/// never folded here. Parsing either yields a whole URL or throws
/// SyntaxError whose detail is the whole input; no other failure comes out
/// of it except an allocation failure.

#include "fen/String.h"
#include "fen/Vector.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace qv::fen {

class OrvekURL {
public:
    /// How the text begins; decides what the first segment is.
    static constexpr std::uint32_t HostForm = 1;     ///< "\\host...": the first segment is the host
    static constexpr std::uint32_t LocalForm = 2;    ///< "\\.\process...": the local host has no segment
    static constexpr std::uint32_t RootForm = 3;     ///< "\path...": the first segment is a path segment
    static constexpr std::uint32_t RelativeForm = 4; ///< "path...": the first segment is a path segment

    /// One step of the URL: a name, or a parent reference ".."; with the
    /// separator that stands in front of it in the text.
    ///
    /// The separator is 0 (the first segment), u'.' or u'\\'; a named
    /// segment never has an empty name.
    class Segment {
    public:
        /// A parent reference. A separator other than 0, '.' or '\' throws
        /// SyntaxError whose detail is that one character.
        explicit Segment(char16_t separator);
        /// A named segment. A bad separator throws as above; an empty name
        /// throws SyntaxError with an empty detail.
        Segment(char16_t separator, const WString& name);

        /// The name; a parent reference has none and throws SyntaxError.
        const WString& GetName() const;
        /// Replaces the name and makes the segment a named one; an empty
        /// name throws SyntaxError and changes nothing.
        void SetName(const WString& name);

        /// The character in front of the segment: 0, u'.' or u'\\'.
        char16_t GetSeparator() const noexcept { return separator_; }
        /// True for a parent reference "..".
        bool IsParent() const noexcept { return isParent_ != 0; }
        /// True exactly when the separator is 0.
        bool HasNoSeparator() const noexcept { return noSeparator_ != 0; }

    private:
        WString name_;
        char16_t separator_;
        std::uint8_t isParent_;
        std::uint8_t noSeparator_;
    };

    /// Parses NUL-terminated `text`; throws SyntaxError with the whole text
    /// as detail when it is not a valid URL. Null is the empty text, which
    /// is a valid relative URL without segments.
    explicit OrvekURL(const char16_t* text);
    /// Parses `text` as above; a text holding a NUL character is rejected.
    explicit OrvekURL(const WString& text);

    OrvekURL(const OrvekURL&) = default;
    OrvekURL& operator=(const OrvekURL&) = default;

    /// The URL as text, which parses back to the same kind and segments.
    /// Names are quoted where the grammar needs it, except the host of a
    /// host-form URL; a trailing ".." keeps its backslash; a trailing
    /// backslash of the parsed text is not repeated. An unknown kind gives
    /// "ERROR".
    WString ToString() const;

    /// One of HostForm, LocalForm, RootForm, RelativeForm.
    std::uint32_t GetKind() const noexcept { return kind_; }
    /// Replaces the kind; 0 throws InvalidArgument and changes nothing.
    void SetKind(std::uint32_t kind);

    /// Number of segments.
    std::size_t GetSegmentCount() const noexcept { return segments_.size(); }
    /// The segment at `index`; an index at or past the end throws OutOfRange.
    const Segment& GetSegment(std::size_t index) const { return segments_[index]; }
    Segment& GetSegment(std::size_t index) { return segments_[index]; }
    /// All segments, in path order.
    const Vector<Segment>& GetSegments() const noexcept { return segments_; }
    /// Replaces all segments, for callers that rewrite a URL (for example
    /// turning a local-form URL into a host-form one).
    void SetSegments(const Vector<Segment>& segments) { segments_ = segments; }

private:
    void Parse(std::u16string_view text);

    Vector<Segment> segments_;
    std::uint32_t kind_ = RelativeForm;
};

} // namespace qv::fen
