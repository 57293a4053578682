#pragma once
/// \file
/// The library's lock: recursive, so the thread holding it may take it again.

#include "fen/Noncopyable.h"

#include <mutex>

namespace qv::fen::osdep {

class Mutex : private Noncopyable {
public:
    void Lock() { mutex_.lock(); }
    void Unlock() { mutex_.unlock(); }
    // The standard names, so std::lock_guard and std::scoped_lock accept it.
    void lock() { Lock(); }
    void unlock() { Unlock(); }

private:
    std::recursive_mutex mutex_;
};

} // namespace qv::fen::osdep
