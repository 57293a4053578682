#include "fen/osdep/ServiceCommandLine.h"

#include "fen/Exception.h"

#include <cctype>
#include <cstdlib>

namespace qv::fen::osdep {
namespace {

bool IsNameCharacter(char c) { return std::isalnum(static_cast<unsigned char>(c)) != 0 || c == '_'; }

std::optional<std::string> FromEnvironment(const std::string& name)
{
    if (const char* value = std::getenv(name.c_str()))
        return std::string(value);
    return std::nullopt;
}

class Splitter {
public:
    Splitter(const std::string& text, const VariableLookup& lookup) : text_(text), lookup_(lookup) {}

    std::vector<std::string> Run()
    {
        while (at_ < text_.size()) {
            const char c = text_[at_];
            if (c == ' ' || c == '\t' || c == '\n' || c == '\r') {
                EndWord();
                ++at_;
            } else if (c == '\'') {
                SingleQuoted();
            } else if (c == '"') {
                DoubleQuoted();
            } else if (c == '\\' && at_ + 1 < text_.size()) {
                Append(text_[at_ + 1]);
                at_ += 2;
            } else if (!TryVariable()) {
                Append(c);
                ++at_;
            }
        }
        EndWord();
        return std::move(words_);
    }

private:
    void Append(char c)
    {
        word_ += c;
        inWord_ = true;
    }
    void EndWord()
    {
        if (inWord_)
            words_.push_back(std::move(word_));
        word_.clear();
        inWord_ = false;
    }

    void SingleQuoted()
    {
        const std::size_t close = text_.find('\'', at_ + 1);
        if (close == std::string::npos)
            QV_THROW(exception::InvalidArgument());
        word_.append(text_, at_ + 1, close - at_ - 1);
        inWord_ = true;
        at_ = close + 1;
    }

    void DoubleQuoted()
    {
        inWord_ = true;
        ++at_;
        while (at_ < text_.size() && text_[at_] != '"') {
            const char c = text_[at_];
            if (c == '\\' && at_ + 1 < text_.size() &&
                (text_[at_ + 1] == '"' || text_[at_ + 1] == '\\' || text_[at_ + 1] == '$')) {
                word_ += text_[at_ + 1];
                at_ += 2;
            } else if (!TryVariable()) {
                word_ += c;
                ++at_;
            }
        }
        if (at_ >= text_.size())
            QV_THROW(exception::InvalidArgument());
        ++at_;
    }

    /// Expands a reference at the current position, if there is one.
    bool TryVariable()
    {
        const char c = text_[at_];
        if (c == '$' && at_ + 1 < text_.size() && text_[at_ + 1] == '{') {
            const std::size_t close = text_.find('}', at_ + 2);
            if (close == std::string::npos)
                QV_THROW(exception::InvalidArgument());
            const std::string name = text_.substr(at_ + 2, close - at_ - 2);
            word_ += Lookup(name).value_or(std::string());
            inWord_ = true;
            at_ = close + 1;
            return true;
        }
        if (c == '%') {
            std::size_t end = at_ + 1;
            while (end < text_.size() && IsNameCharacter(text_[end]))
                ++end;
            if (end == at_ + 1 || end >= text_.size() || text_[end] != '%')
                return false;
            const std::string name = text_.substr(at_ + 1, end - at_ - 1);
            if (auto value = Lookup(name)) {
                word_ += *value;
                inWord_ = true;
                at_ = end + 1;
                return true;
            }
            return false;
        }
        return false;
    }

    std::optional<std::string> Lookup(const std::string& name) const
    {
        return lookup_ ? lookup_(name) : FromEnvironment(name);
    }

    const std::string& text_;
    const VariableLookup& lookup_;
    std::size_t at_ = 0;
    std::string word_;
    bool inWord_ = false;
    std::vector<std::string> words_;
};

} // namespace

std::vector<std::string> SplitCommandLine(const std::string& commandLine, const VariableLookup& lookup)
{
    return Splitter(commandLine, lookup).Run();
}

} // namespace qv::fen::osdep
