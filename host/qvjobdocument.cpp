#include "host/qvjobdocument.h"

#include <algorithm>
#include <utility>

#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmstrings.h"

namespace zm::qvrun {
namespace {

std::u16string_view KeyOf(std::u16string_view line) {
    return line.substr(0, line.find(u'='));
}

bool IsSetting(std::u16string_view line) {
    return ReadJobLine(line).kind == jlSetting;
}

bool IsBlank(std::u16string_view line) {
    return line.find_first_not_of(u" \t") == std::u16string_view::npos;
}

bool IsComment(std::u16string_view line) {
    return !IsBlank(line) && ReadJobLine(line).kind == jlNothing;
}

/// The next line end of a text from `from` on, with its length (0 at the text's end).
std::pair<std::size_t, std::size_t> FindLineEnd(std::u16string_view text, std::size_t from) {
    const std::size_t found = text.find_first_of(u"\r\n", from);
    if (found == std::u16string_view::npos) {
        return {text.size(), 0};
    }
    return {found, text.substr(found, 2) == u"\r\n" ? 2 : 1};
}

}  // namespace

bool TJobDocument::Parse(std::string_view text, TJobFileError& error) {
    TJobDocument parsed;
    TJobFile checked;
    if (!ParseJobText(text, checked, error) &&
        (error.line != 0 || !checked.steps.empty() || text.find('\0') != std::string_view::npos)) {
        return false;
    }
    parsed.has_byte_order_mark_ = text.starts_with(kByteOrderMark);
    if (parsed.has_byte_order_mark_) {
        text.remove_prefix(kByteOrderMark.size());
    }
    const std::u16string wide = Utf16FromUtf8(text);
    for (std::size_t from = 0; from < wide.size();) {
        const auto [end, end_length] = FindLineEnd(wide, from);
        if (from == 0 && end_length != 0) {
            parsed.line_end_ = wide.substr(end, end_length);
        }
        TLine line{wide.substr(from, end - from), wide.substr(end, end_length)};
        TJobLine read = ReadJobLine(line.text);
        if (read.kind == jlHead) {
            parsed.AddSection(std::move(line), std::move(read.action));
        } else {
            TLines& lines = parsed.steps_.empty() ? parsed.preamble_ : parsed.steps_.back().lines;
            lines.push_back(std::move(line));
        }
        from = end + end_length;
    }
    *this = std::move(parsed);
    return true;
}

/// Begins a section; the comments directly above its head leave the section before it.
void TJobDocument::AddSection(TLine head, std::u16string action) {
    TSection section;
    section.action = std::move(action);
    if (!steps_.empty()) {
        TLines& before = steps_.back().lines;
        auto first = before.end();
        while (first - before.begin() > 1 && IsComment((first - 1)->text)) {
            --first;
        }
        section.lines.assign(std::make_move_iterator(first), std::make_move_iterator(before.end()));
        before.erase(first, before.end());
    }
    section.head = section.lines.size();
    section.lines.push_back(std::move(head));
    steps_.push_back(std::move(section));
}

std::string TJobDocument::Text() const {
    std::u16string text;
    const auto add = [&text](const TLines& lines) {
        for (const TLine& line : lines) {
            text.append(line.text).append(line.end);
        }
    };
    add(preamble_);
    for (const TSection& section : steps_) {
        add(section.lines);
    }
    return (has_byte_order_mark_ ? std::string(kByteOrderMark) : "") + Utf8FromUtf16(text);
}

TJobStep TJobDocument::Step(std::size_t index) const {
    ZM_ASSERT(index < steps_.size());
    const TSection& section = steps_[index];
    std::size_t line = preamble_.size() + section.head + 1;
    for (std::size_t before = 0; before < index; ++before) {
        line += steps_[before].lines.size();
    }
    TJobStep step{section.action, {}, static_cast<std::int32_t>(line)};
    for (const TLine& each : section.lines) {
        if (IsSetting(each.text)) {
            step.text.append(each.text).append(u"\r\n");
        }
    }
    return step;
}

TJobDocument::TSection TJobDocument::NewSection(const std::u16string& action,
                                                const std::u16string& step_text) const {
    TSection section;
    section.action = action;
    section.lines.push_back({u"[" + action + u"]", line_end_});
    for (std::u16string& line : SplitLines(step_text)) {
        if (IsSetting(line)) {
            section.lines.push_back({std::move(line), line_end_});
        }
    }
    return section;
}

void TJobDocument::EndLastLine() {
    TLines& last = steps_.empty() ? preamble_ : steps_.back().lines;
    if (!last.empty() && last.back().end.empty()) {
        last.back().end = line_end_;
    }
}

/// Sections are easier to tell apart with a blank line between them.
void TJobDocument::SeparateFromBefore(std::size_t index) {
    TLines& before = index == 0 ? preamble_ : steps_[index - 1].lines;
    const bool belongs_together = index == 0 && !before.empty() && IsComment(before.back().text);
    if (!before.empty() && !belongs_together && !IsBlank(before.back().text)) {
        before.push_back({u"", line_end_});
    }
}

void TJobDocument::InsertStep(std::size_t index, const std::u16string& action,
                              const std::u16string& step_text) {
    ZM_ASSERT(index <= steps_.size());
    EndLastLine();
    TSection section = NewSection(action, step_text);
    steps_.insert(steps_.begin() + static_cast<std::ptrdiff_t>(index), std::move(section));
    SeparateFromBefore(index);
    if (index + 1 < steps_.size()) {
        SeparateFromBefore(index + 1);
    }
}

void TJobDocument::RemoveStep(std::size_t index) {
    ZM_ASSERT(index < steps_.size());
    steps_.erase(steps_.begin() + static_cast<std::ptrdiff_t>(index));
}

void TJobDocument::MoveStep(std::size_t from, std::size_t to) {
    ZM_ASSERT(from < steps_.size() && to < steps_.size());
    if (from == to) {
        return;
    }
    EndLastLine();
    TSection section = std::move(steps_[from]);
    steps_.erase(steps_.begin() + static_cast<std::ptrdiff_t>(from));
    steps_.insert(steps_.begin() + static_cast<std::ptrdiff_t>(to), std::move(section));
    for (std::size_t index = 1; index < steps_.size(); ++index) {
        SeparateFromBefore(index);
    }
}

/// The section's lines without the keys that go. What they say is taken from `wanted`, and what
/// stays in it is new.
TJobDocument::TLines TJobDocument::KeptLines(const TSection& section, TLines& wanted) const {
    TLines kept;
    for (const TLine& line : section.lines) {
        if (!IsSetting(line.text)) {
            kept.push_back(line);
            continue;
        }
        const auto found = std::find_if(wanted.begin(), wanted.end(), [&line](const TLine& want) {
            return KeysEqualNoCase(KeyOf(want.text), KeyOf(line.text));
        });
        if (found != wanted.end()) {
            const std::u16string value = found->text.substr(KeyOf(found->text).size());
            kept.push_back({std::u16string(KeyOf(line.text)) + value, line.end});
            wanted.erase(found);
        }
    }
    return kept;
}

void TJobDocument::SetStepText(std::size_t index, const std::u16string& step_text) {
    ZM_ASSERT(index < steps_.size());
    if (index + 1 == steps_.size()) {
        EndLastLine();
    }
    TSection& section = steps_[index];
    TLines wanted = NewSection(section.action, step_text).lines;
    wanted.erase(wanted.begin());
    TLines lines = KeptLines(section, wanted);
    std::size_t place = section.head + 1;
    for (std::size_t line = place; line < lines.size(); ++line) {
        place = IsSetting(lines[line].text) ? line + 1 : place;
    }
    lines.insert(lines.begin() + static_cast<std::ptrdiff_t>(place), wanted.begin(), wanted.end());
    section.lines = std::move(lines);
}

}  // namespace zm::qvrun
