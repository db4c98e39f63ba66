// tesutil on a 64 MiB checksummed file: the time and the peak resident memory of the process
// (the kernel's ru_maxrss of the child) for verify, checksum and stamp.
//
//   BM_Tool/verify|checksum|stamp   peak_MiB: the tool's peak resident memory.
// Target: under 32 MiB for each, whatever the file's size (the commands stream the file).
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

extern char** environ;

namespace fs = std::filesystem;

namespace {

constexpr std::size_t kMiB = 1024 * 1024;
constexpr double kTargetMiB = 32.0;

const std::string& DataFile() {
    static const std::string path = [] {
        const fs::path file =
            fs::temp_directory_path() / ("tesu-tool-bench-" + std::to_string(getpid()) + ".cfg");
        std::ofstream out(file, std::ios::binary);
        const std::string line(79, 'd');
        for (std::size_t written = 0; written < 64 * kMiB; written += line.size() + 1) {
            out << line << '\n';
        }
        return file.string();
    }();
    return path;
}

// Runs tesutil with `arguments`, its output thrown away; the child's peak resident memory in
// MiB, or a negative value when it did not end with status 0.
double RunTool(const std::vector<std::string>& arguments) {
    std::vector<std::string> strings = {TESUTIL_EXECUTABLE};
    strings.insert(strings.end(), arguments.begin(), arguments.end());
    std::vector<char*> argv;
    for (std::string& text : strings) {
        argv.push_back(text.data());
    }
    argv.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", O_WRONLY, 0);
    pid_t pid = 0;
    const int spawned = posix_spawn(&pid, argv[0], &actions, nullptr, argv.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    int status = 0;
    struct rusage usage {};
    if (spawned != 0 || wait4(pid, &status, 0, &usage) != pid || !WIFEXITED(status) ||
        WEXITSTATUS(status) != 0) {
        return -1.0;
    }
    return static_cast<double>(usage.ru_maxrss) / 1024.0;  // ru_maxrss is in KiB
}

void BM_Tool(benchmark::State& state, const char* command) {
    double peak = 0.0;
    for (auto _ : state) {
        const double run = RunTool({command, DataFile()});
        if (run < 0.0) {
            state.SkipWithError("tesutil failed");
            return;
        }
        peak = std::max(peak, run);
    }
    state.counters["peak_MiB"] = peak;
    if (peak >= kTargetMiB) {
        state.SkipWithError("peak resident memory at or above 32 MiB");
    }
}

}  // namespace

// verify first: stamp changes the file (once; then it is already stamped).
BENCHMARK_CAPTURE(BM_Tool, verify, "verify")->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK_CAPTURE(BM_Tool, checksum, "checksum")->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK_CAPTURE(BM_Tool, stamp, "stamp")->Unit(benchmark::kMillisecond)->Iterations(3);

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    std::error_code ignored;
    fs::remove(DataFile(), ignored);
    return 0;
}
