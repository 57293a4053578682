#pragma once
// Makes a locale picture source current for a test and puts the previous
// one back afterwards.

#include "fen/osdep/LocalePicture.h"

#include <memory>

namespace qv::test {

class ScopedPictureSource {
public:
    explicit ScopedPictureSource(std::shared_ptr<const fen::osdep::LocalePictureSource> source)
        : previous_(fen::osdep::SetLocalePictureSource(std::move(source)))
    {
    }
    ~ScopedPictureSource() { fen::osdep::SetLocalePictureSource(previous_); }
    ScopedPictureSource(const ScopedPictureSource&) = delete;
    ScopedPictureSource& operator=(const ScopedPictureSource&) = delete;

private:
    std::shared_ptr<const fen::osdep::LocalePictureSource> previous_;
};

} // namespace qv::test
