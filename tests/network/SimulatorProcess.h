#pragma once
// orvek-sim as a child process of a test. ORVEK_SIM_PROGRAM, the path of the
// program, comes from the build.

#include "support/ChildProcess.h"

namespace qv::test {

class Simulator : public ChildProcess {
public:
    explicit Simulator(std::vector<std::string> arguments) : ChildProcess(ORVEK_SIM_PROGRAM, std::move(arguments)) {}
};

} // namespace qv::test
