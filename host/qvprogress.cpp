#include "host/qvprogress.h"

#include "engine/foundation/zmstrings.h"
#include "engine/platform/console.h"

namespace zm::qvrun {
namespace {

constexpr std::size_t kBarWidth = 30;

std::string FileLabel(const TRunRequest& request, std::size_t index) {
    const std::u16string& file = request.files[index];
    return file.empty() ? "job" : Utf8FromUtf16(file);
}

}  // namespace

TProgressView::TProgressView(const TRunRequest& request, bool is_terminal, bool quiet)
    : request_(request), is_terminal_(is_terminal), quiet_(quiet) {
    if (is_terminal_ && !quiet_) {
        DrawBar();
    }
}

void TProgressView::DrawBar() const {
    const std::size_t total = request_.files.size();
    const std::size_t filled = total == 0 ? kBarWidth : kBarWidth * ended_ / total;
    platform::WriteStderr("\r[" + std::string(filled, '#') + std::string(kBarWidth - filled, '.') +
                          "] " + std::to_string(ended_) + "/" + std::to_string(total));
}

void TProgressView::EraseBar() const {
    platform::WriteStderr("\r\x1B[K");
}

std::string TProgressView::FailureText(const TRunRequest& request, const TJobOutcome& outcome) {
    const TRunStep& step = request.steps[outcome.failed_step];
    std::string text =
        FileLabel(request, outcome.index) + ": step " + std::to_string(outcome.failed_step + 1) +
        " (" + Utf8FromUtf16(step.action_name) + ", line " + std::to_string(step.line) + ") failed";
    if (outcome.code != 0) {
        text += ", code " + std::to_string(outcome.code);
    }
    return text + ": " + Utf8FromUtf16(outcome.text) + "\n";
}

void TProgressView::JobEnded(const TJobOutcome& outcome) {
    ++ended_;
    const bool with_bar = is_terminal_ && !quiet_;
    if (with_bar) {
        EraseBar();
    }
    if (!outcome.succeeded) {
        platform::WriteStderr(FailureText(request_, outcome));
    } else if (!quiet_ && !is_terminal_) {
        platform::WriteStderr(FileLabel(request_, outcome.index) + ": done\n");
    }
    for (const std::u16string& line : outcome.step_descriptions) {
        platform::WriteStdout("  " + Utf8FromUtf16(line) + "\n");
    }
    if (with_bar) {
        DrawBar();
    }
}

void TProgressView::Finish(std::size_t failures) {
    if (is_terminal_ && !quiet_) {
        EraseBar();
    }
    if (!quiet_) {
        platform::WriteStderr(std::to_string(request_.files.size() - failures) + " done, " +
                              std::to_string(failures) + " failed\n");
    }
}

}  // namespace zm::qvrun
