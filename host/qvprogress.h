#pragma once

#include <cstddef>
#include <string>

#include "host/qvrunner.h"

namespace zm::qvrun {

/// How a run is shown on standard error: a bar on a terminal, plain lines otherwise. Not
/// thread-safe.
class TProgressView {
public:
    /// `quiet` shows failures only.
    TProgressView(const TRunRequest& request, bool is_terminal, bool quiet);
    /// Shows that a job has ended, and why it failed if it did.
    void JobEnded(const TJobOutcome& outcome);
    /// Takes the bar away and, unless quiet, shows the sum.
    void Finish(std::size_t failures);

    /// Lines that tell of a failed job: file, step, code and text.
    static std::string FailureText(const TRunRequest& request, const TJobOutcome& outcome);

private:
    void DrawBar() const;
    void EraseBar() const;

    const TRunRequest& request_;
    bool is_terminal_;
    bool quiet_;
    std::size_t ended_ = 0;
};

}  // namespace zm::qvrun
