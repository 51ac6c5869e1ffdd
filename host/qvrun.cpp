#include <CLI/CLI.hpp>
#include <algorithm>
#include <array>
#include <fstream>
#include <iostream>
#include <optional>
#include <sstream>

#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/console.h"
#include "engine/platform/files.h"
#include "engine/platform/module.h"
#include "host/qvedit.h"
#include "host/qvprogress.h"
#include "host/qvrunner.h"

/// qvrun: runs job files through the graphics plug-in, once per picture.
namespace zm::qvrun {
namespace {

constexpr int kExitDone = 0;
constexpr int kExitStepFailed = 1;
constexpr int kExitUsage = 2;
constexpr std::int64_t kMaxJobFileBytes = std::int64_t{64} << 20;

struct TOptions {
    std::string plugin;
    std::string job_file;
    std::vector<std::string> files;
    std::string files_from;
    std::vector<std::string> settings;
    std::string output = ".";
    int jobs = 1;
    bool null_separated = false;
    bool dry_run = false;
    bool verbose = false;
    bool quiet = false;
};

int UsageError(const std::string& message) {
    platform::WriteStderr("qvrun: " + message + "\n");
    return kExitUsage;
}

int JobFileError(const std::string& job_file, const TJobFileError& error) {
    const std::string place = error.line > 0 ? ":" + std::to_string(error.line) : "";
    platform::WriteStderr(job_file + place + ": " + error.message + "\n");
    return kExitUsage;
}

/// Text of a pipe or device, which have no size to ask for; the limit cuts it off.
std::string ReadPipe(const std::string& name) {
    std::ifstream stream(name, std::ios::binary);
    std::string text;
    std::array<char, 1 << 16> block{};
    while (stream && static_cast<std::int64_t>(text.size()) <= kMaxJobFileBytes) {
        stream.read(block.data(), static_cast<std::streamsize>(block.size()));
        text.append(block.data(), static_cast<std::size_t>(stream.gcount()));
    }
    return text;
}

/// Whole text of a file; nothing, with the reason, when it cannot be read.
std::optional<std::string> ReadTextFile(const std::string& name, std::string& error_text) {
    try {
        std::string text;
        if (platform::GetFileKind(Utf16FromUtf8(name)) == platform::fkOther) {
            text = ReadPipe(name);
        } else {
            TFileStream stream(Utf16FromUtf8(name), fmOpenRead);
            const std::int64_t size = std::min(stream.GetSize(), kMaxJobFileBytes + 1);
            text.resize(static_cast<std::size_t>(size));
            stream.ReadBuffer(text.data(), text.size());
        }
        if (static_cast<std::int64_t>(text.size()) <= kMaxJobFileBytes) {
            return text;
        }
        error_text = "the file is too large";
    } catch (const std::exception& error) {
        error_text = error.what();
    }
    return std::nullopt;
}

void AddNames(std::string_view text, char separator, std::vector<std::u16string>& files) {
    for (std::string& name : SplitText(text, separator)) {
        if (separator == '\n' && name.ends_with('\r')) {
            name.pop_back();
        }
        if (!name.empty()) {
            files.push_back(Utf16FromUtf8(name));
        }
    }
}

std::string StandardInput() {
    std::ostringstream text;
    text << std::cin.rdbuf();
    return text.str();
}

/// Files of the command line, of --files-from, and of standard input where "-" stands.
bool CollectFiles(const TOptions& options, std::vector<std::u16string>& files,
                  std::string& error_text) {
    const char separator = options.null_separated ? '\0' : '\n';
    for (const std::string& name : options.files) {
        if (name == "-") {
            AddNames(StandardInput(), separator, files);
        } else {
            files.push_back(Utf16FromUtf8(name));
        }
    }
    if (options.files_from.empty()) {
        return true;
    }
    if (options.files_from == "-") {
        AddNames(StandardInput(), separator, files);
        return true;
    }
    const auto text = ReadTextFile(options.files_from, error_text);
    if (text) {
        AddNames(*text, separator, files);
    }
    return text.has_value();
}

bool ParseSettings(const std::vector<std::string>& settings,
                   std::map<std::u16string, std::u16string>& variables, std::string& error_text) {
    for (const std::string& setting : settings) {
        const std::size_t equals = setting.find('=');
        if (equals == std::string::npos || equals == 0) {
            error_text = "--set expects NAME=VALUE, not \"" + setting + "\"";
            return false;
        }
        variables[Utf16FromUtf8(setting.substr(0, equals))] =
            Utf16FromUtf8(setting.substr(equals + 1));
    }
    return true;
}

std::u16string PluginPath(const TOptions& options) {
    if (!options.plugin.empty()) {
        return Utf16FromUtf8(options.plugin);
    }
    return FileFolder(platform::ProgramPath()) + u"Graphics.qvp";
}

bool LoadPlugin(const TOptions& options, THost& host) {
    std::string error_text;
    const std::u16string path = PluginPath(options);
    if (host.Load(path, error_text)) {
        return true;
    }
    UsageError("cannot load the plug-in " + Utf8FromUtf16(path) + ": " + error_text);
    return false;
}

int ListActions(const TOptions& options) {
    THost host;
    if (!LoadPlugin(options, host)) {
        return kExitUsage;
    }
    for (std::int32_t index = 0; index < host.ActionCount(); ++index) {
        const THostAction action = host.Action(index);
        std::string name = Utf8FromUtf16(action.name);
        name.resize(std::max<std::size_t>(name.size(), 22), ' ');
        platform::WriteStdout(name + Utf8FromUtf16(action.id) + "\n");
    }
    return kExitDone;
}

int RunResolved(const TOptions& options, const THost& host, TRunRequest& request) {
    if (!platform::CreateFolder(request.output_folder)) {
        return UsageError("cannot make the output folder " + options.output);
    }
    TProgressView view(request, platform::StderrIsTerminal(), options.quiet);
    const std::size_t failures =
        RunJobs(host, request, [&view](const TJobOutcome& outcome) { view.JobEnded(outcome); });
    view.Finish(failures);
    return failures == 0 ? kExitDone : kExitStepFailed;
}

/// The run's inputs beside the job file; False after telling what is wrong.
bool FillRequest(const TOptions& options, const TJobFile& job, TRunRequest& request) {
    std::string error_text;
    if (!CollectFiles(options, request.files, error_text) ||
        !ParseSettings(options.settings, request.user_variables, error_text)) {
        UsageError(error_text);
        return false;
    }
    request.output_folder = Utf16FromUtf8(options.output);
    request.workers = options.jobs;
    request.report_steps = options.verbose;
    const bool no_list = options.files.empty() && options.files_from.empty();
    if (no_list && job.uses_input_file && !options.dry_run) {
        UsageError("the job refers to its input file, but no file was given");
        return false;
    }
    if (no_list) {
        request.files.emplace_back();  // a job without an input file runs once
    }
    return true;
}

int RunJobFile(const TOptions& options) {
    std::string error_text;
    const auto text = ReadTextFile(options.job_file, error_text);
    if (!text) {
        return UsageError("cannot read the job file: " + error_text);
    }
    TJobFile job;
    TJobFileError error;
    if (!ParseJobText(*text, job, error)) {
        return JobFileError(options.job_file, error);
    }
    THost host;
    if (!LoadPlugin(options, host)) {
        return kExitUsage;
    }
    TRunRequest request;
    if (!ResolveSteps(job, host, request.steps, error)) {
        return JobFileError(options.job_file, error);
    }
    if (!FillRequest(options, job, request)) {
        return kExitUsage;
    }
    if (options.dry_run) {
        for (const std::u16string& line : DescribeSteps(host, request.steps)) {
            platform::WriteStdout(Utf8FromUtf16(line) + "\n");
        }
        return kExitDone;
    }
    return RunResolved(options, host, request);
}

/// The job's text; nothing, without an error, when there is no such file yet.
std::optional<std::string> ReadJobToEdit(const std::string& name, std::string& error_text) {
    if (platform::GetFileKind(Utf16FromUtf8(name)) == platform::fkNone) {
        return std::nullopt;
    }
    return ReadTextFile(name, error_text);
}

int EditJobFile(const TOptions& options) {
    std::string error_text;
    const auto text = ReadJobToEdit(options.job_file, error_text);
    if (!error_text.empty()) {
        return UsageError("cannot read the job file: " + error_text);
    }
    THost host;
    if (!LoadPlugin(options, host)) {
        return kExitUsage;
    }
    std::u16string reason;
    IJobEditorWindow* const window = FindEditWindow(FileFolder(platform::ProgramPath()), reason);
    TJobEditor editor(host, Utf16FromUtf8(options.job_file), window);
    TJobFileError error;
    if (!editor.Open(text, error)) {
        return JobFileError(options.job_file, error);
    }
    if (window == nullptr) {
        return UsageError("cannot open the job editor: " + Utf8FromUtf16(reason) +
                          "; a job file is plain text, any text editor changes it too");
    }
    window->Run(editor);
    return kExitDone;
}

void DeclareRunOptions(CLI::App& run, TOptions& options) {
    run.add_option("job", options.job_file, "Job file")->required();
    run.add_option("files", options.files,
                   "Pictures, one job each; - reads names from standard input");
    run.add_option("--files-from", options.files_from,
                   "File with one name per line (- for standard input)");
    run.add_flag("-0,--null", options.null_separated, "Names in lists end in a zero byte");
    run.add_option("-j,--jobs", options.jobs, "Jobs at a time")->check(CLI::Range(1, 256));
    run.add_option("--set", options.settings, "NAME=VALUE: a variable {NAME} for the job")
        ->expected(1)
        ->allow_extra_args(false)  // what follows may be the job or a file
        ->take_all();
    run.add_option("-o,--output", options.output, "Folder that {out} stands for (made if missing)")
        ->check([](const std::string& name) {
            return name.empty() ? std::string("the folder's name is empty") : std::string();
        });
    run.add_flag("-n,--dry-run", options.dry_run, "Print what each step does and run nothing");
    run.add_flag("-v,--verbose", options.verbose, "Print each step's description as it runs");
    run.add_flag("-q,--quiet", options.quiet, "Show failures only");
}

int Main(const std::vector<std::string>& arguments) {
    CLI::App app{"Runs job files through the graphics plug-in, once per picture.", "qvrun"};
    TOptions options;
    app.allow_windows_style_options(false);  // a path that starts with a slash is no option
    app.require_subcommand(1);
    CLI::App* run = app.add_subcommand("run", "Run a job file over pictures");
    CLI::App* actions = app.add_subcommand("actions", "List the plug-in's actions and their ids");
    CLI::App* edit = app.add_subcommand("edit", "Make or change a job file in a window");
    edit->add_option("job", options.job_file, "Job file; made when it is not there")->required();
    for (CLI::App* command : {run, actions, edit}) {
        command->add_option("--plugin", options.plugin,
                            "The plug-in (default: Graphics.qvp beside qvrun)");
    }
    DeclareRunOptions(*run, options);
    std::vector<std::string> reversed(arguments.rbegin(), arguments.rend() - 1);
    try {
        app.parse(reversed);
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? kExitDone : kExitUsage;
    }
    if (edit->parsed()) {
        return EditJobFile(options);
    }
    return actions->parsed() ? ListActions(options) : RunJobFile(options);
}

}  // namespace
}  // namespace zm::qvrun

int main(int argc, char** argv) {
    try {
        return zm::qvrun::Main(zm::platform::ProgramArguments(argc, argv));
    } catch (const std::exception& error) {
        zm::platform::WriteStderr(std::string("qvrun: ") + error.what() + "\n");
        return zm::qvrun::kExitUsage;
    }
}
