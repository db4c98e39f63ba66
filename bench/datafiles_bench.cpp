// Data files: checking a large checksummed file against the system's cksum on the same file
// and against the floor of reading it and computing the CRC-32 of all its bytes; its memory;
// the layer's CRC-32 against ISA-L, libdeflate and zlib called directly; reading a long file
// list. The data is generated in a temporary directory and removed at the end. Times are
// processor seconds (kernel time included; for cksum, those of the child process), so the
// load of other processes counts little.
//
//   BM_FreadFile                   the file read with std::fread into a 1 MiB buffer.
//   BM_ReadAndCrcFloor             read(2) into a 1 MiB buffer and the CRC-32 of every byte with
//                                  the fastest library at hand: the floor under the check.
//   BM_ValidateFileChecksum        the check; peak_MiB: the peak resident memory during the
//                                  checks above the resident memory before them.
//   BM_ValidateVersusCksum         per iteration one run of cksum on the file as a process, one
//                                  check and one floor pass, side by side; vs_cksum: the check's
//                                  time over cksum's; vs_floor: the check's time over the
//                                  floor's; *_ms: the three times.
//   BM_Crc32_*                     the CRC-32 of 64 MiB: the layer's, ISA-L's, libdeflate's,
//                                  zlib's.
//   BM_Crc32_PortVersusIsal        vs_isal: the layer's speed over crc32_gzip_refl's (called
//                                  directly), timed side by side.
//   BM_FileListFileStrings         a list of 10,000 existing members; per_member: the time
//                                  per member.
//   BM_StatPerMember               one stat(2) of each member's path: the floor under the list.
// Targets: vs_cksum <= 0.8; peak_MiB < 16; vs_isal >= 0.9; per_member <= 1.5 us.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>
#include <zlib.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

#if defined(TESU_BENCH_ISAL)
#include <isa-l/crc.h>
#endif
#if defined(TESU_BENCH_LIBDEFLATE)
#include <libdeflate.h>
#endif

#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_String.h"
#include "Tesu_Utilities.h"

namespace fs = std::filesystem;

namespace {

constexpr std::size_t kMiB = 1024 * 1024;
constexpr std::size_t kChecksummedSize = 256 * kMiB;
constexpr std::size_t kLineLength = 80;  // with its line break
constexpr std::size_t kCrcSize = 64 * kMiB;
constexpr int kListMembers = 10000;

// The folder of the generated data, made on first use and removed by main.
const fs::path& DataDirectory() {
    static const fs::path directory = [] {
        fs::path path =
            fs::temp_directory_path() / ("tesu-datafiles-bench-" + std::to_string(getpid()));
        fs::create_directories(path);
        return path;
    }();
    return directory;
}

// A file of 80-character lines, one in twenty a comment, stamped at its end with a valid
// checksum line.
const std::string& ChecksummedFile() {
    static const std::string path = [] {
        const std::string name = (DataDirectory() / "checksummed.txt").string();
        std::FILE* out = std::fopen(name.c_str(), "wb");
        if (out == nullptr) {
            throw std::runtime_error("cannot write " + name);
        }
        // Lines are cut from a pool of random printable text (no "#") at varying offsets.
        std::mt19937 random(42);
        std::uniform_int_distribution<int> printable(' ', '~');
        std::string pool(64 * 1024, ' ');
        for (char& c : pool) {
            c = static_cast<char>(printable(random));
            if (c == '#') {
                c = '+';
            }
        }
        std::string block;
        std::uint32_t crc = 0;
        const std::size_t lines = kChecksummedSize / kLineLength - 1;
        const std::size_t textLength = kLineLength - 1;
        for (std::size_t i = 0; i < lines; ++i) {
            const std::size_t at = block.size();
            block.append(pool, (i * 7919) % (pool.size() - textLength), textLength);
            if (i % 20 == 0) {
                block.replace(at, 10, "# comment ");
            } else {
                crc = Port::StringBase<char>::CRC32(crc, block.data() + at, textLength);
            }
            block += '\n';
            if (block.size() >= kMiB) {
                std::fwrite(block.data(), 1, block.size(), out);
                block.clear();
            }
        }
        char stamp[32];
        std::snprintf(stamp, sizeof stamp, "# CRC: %8x\n", static_cast<unsigned int>(crc));
        block += stamp;
        std::fwrite(block.data(), 1, block.size(), out);
        if (std::fclose(out) != 0) {
            throw std::runtime_error("cannot write " + name);
        }
        return name;
    }();
    return path;
}

// The processor time of the process so far, in seconds: kernel time included, since reading
// a file is mostly the kernel's copying. The load of other processes does not count.
double CpuSeconds() {
    timespec now{};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) * 1e-9;
}

// A value in kB from /proc/self/status ("VmRSS", "VmHWM"), or -1.
long StatusKiB(const char* key) {
    std::ifstream status("/proc/self/status");
    std::string line;
    const std::size_t keyLength = std::strlen(key);
    while (std::getline(status, line)) {
        if (line.compare(0, keyLength, key) == 0 && line.size() > keyLength &&
            line[keyLength] == ':') {
            return std::stol(line.substr(keyLength + 1));
        }
    }
    return -1;
}

// Sets the peak resident size back to the current one; false where the kernel does not allow.
bool ResetPeakMemory() {
    std::ofstream clear("/proc/self/clear_refs");
    clear << "5";
    clear.flush();
    return static_cast<bool>(clear);
}

void BM_FreadFile(benchmark::State& state) {
    const std::string& path = ChecksummedFile();
    std::vector<char> buffer(kMiB);
    std::size_t total = 0;
    for (auto _ : state) {
        std::FILE* in = std::fopen(path.c_str(), "rb");
        if (in == nullptr) {
            state.SkipWithError("cannot open the file");
            return;
        }
        std::size_t got = 0;
        while ((got = std::fread(buffer.data(), 1, buffer.size(), in)) > 0) {
            total += got;
        }
        std::fclose(in);
        benchmark::DoNotOptimize(buffer.data());
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(total));
}

void BM_ValidateFileChecksum(benchmark::State& state) {
    const Port::StringBase<char> path(ChecksummedFile());
    const std::size_t size = fs::file_size(path.str());
    const bool peakReset = ResetPeakMemory();
    const long baselineKiB = peakReset ? StatusKiB("VmRSS") : StatusKiB("VmHWM");
    for (auto _ : state) {
        bool verdict = false;
        const unsigned int result = Tesu::Utilities::ValidateFileChecksum(path, verdict);
        if (result != 0 || !verdict) {
            state.SkipWithError("the generated file does not validate");
            return;
        }
    }
    const long peakKiB = StatusKiB("VmHWM");
    state.SetBytesProcessed(static_cast<std::int64_t>(size * state.iterations()));
    state.counters["peak_MiB"] = static_cast<double>(peakKiB - baselineKiB) / 1024.0;
    if (!peakReset) {
        state.SetLabel("peak not reset: lower bound");
    }
}

// The CRC-32 of bytes with the fastest library at hand, called directly.
std::uint32_t BestCrc32(std::uint32_t crc, const unsigned char* data, std::size_t length) {
#if defined(TESU_BENCH_ISAL)
    return crc32_gzip_refl(crc, data, length);
#elif defined(TESU_BENCH_LIBDEFLATE)
    return libdeflate_crc32(crc, data, length);
#else
    return Port::StringBase<char>::CRC32(crc, data, length);
#endif
}

const char* BestCrc32Name() {
#if defined(TESU_BENCH_ISAL)
    return "isa-l";
#elif defined(TESU_BENCH_LIBDEFLATE)
    return "libdeflate";
#else
    return Port::StringBase<char>::CRC32Implementation();
#endif
}

// The floor: read(2) the whole file into `buffer` and the CRC-32 of every byte. False when the
// file does not open.
bool ReadAndCrc(const std::string& path, std::vector<unsigned char>& buffer, std::uint32_t& crc) {
    const int fd = ::open(path.c_str(), O_RDONLY);
    if (fd < 0) {
        return false;
    }
    crc = 0;
    ssize_t got = 0;
    while ((got = ::read(fd, buffer.data(), buffer.size())) > 0) {
        crc = BestCrc32(crc, buffer.data(), static_cast<std::size_t>(got));
    }
    ::close(fd);
    return got == 0;
}

void BM_ReadAndCrcFloor(benchmark::State& state) {
    const std::string& path = ChecksummedFile();
    const std::size_t size = fs::file_size(path);
    std::vector<unsigned char> buffer(kMiB);
    for (auto _ : state) {
        std::uint32_t crc = 0;
        if (!ReadAndCrc(path, buffer, crc)) {
            state.SkipWithError("cannot read the file");
            return;
        }
        benchmark::DoNotOptimize(crc);
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(size * state.iterations()));
    state.SetLabel(BestCrc32Name());
}

#if defined(TESU_CKSUM)
// Runs cksum on `path`, its output thrown away; the processor seconds of the child, or a
// negative value when it could not be run or failed.
double CksumSeconds(const std::string& path) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    std::string program = TESU_CKSUM;
    std::string file = path;
    char* argv[] = {program.data(), file.data(), nullptr};
    pid_t child = 0;
    const int spawned = posix_spawn(&child, program.c_str(), &actions, nullptr, argv, environ);
    posix_spawn_file_actions_destroy(&actions);
    if (spawned != 0) {
        return -1.0;
    }
    int status = 0;
    rusage usage{};
    if (wait4(child, &status, 0, &usage) != child || !WIFEXITED(status) ||
        WEXITSTATUS(status) != 0) {
        return -1.0;
    }
    auto seconds = [](const timeval& t) {
        return static_cast<double>(t.tv_sec) + static_cast<double>(t.tv_usec) * 1e-6;
    };
    return seconds(usage.ru_utime) + seconds(usage.ru_stime);
}

// cksum as a process, the check and the floor, one of each per iteration, so that the ratios
// are measured under the same conditions.
void BM_ValidateVersusCksum(benchmark::State& state) {
    const std::string& path = ChecksummedFile();
    const Port::StringBase<char> name(path);
    std::vector<unsigned char> buffer(kMiB);
    double cksumSeconds = 0.0;
    double validateSeconds = 0.0;
    double floorSeconds = 0.0;
    for (auto _ : state) {
        const double cksum = CksumSeconds(path);
        if (cksum < 0.0) {
            state.SkipWithError("cksum did not run");
            return;
        }
        cksumSeconds += cksum;
        const double start = CpuSeconds();
        bool verdict = false;
        const unsigned int result = Tesu::Utilities::ValidateFileChecksum(name, verdict);
        const double middle = CpuSeconds();
        std::uint32_t crc = 0;
        const bool read = ReadAndCrc(path, buffer, crc);
        const double end = CpuSeconds();
        benchmark::DoNotOptimize(crc);
        if (result != 0 || !verdict || !read) {
            state.SkipWithError("the generated file does not validate");
            return;
        }
        validateSeconds += middle - start;
        floorSeconds += end - middle;
    }
    const double n = static_cast<double>(state.iterations());
    state.counters["vs_cksum"] = cksumSeconds > 0.0 ? validateSeconds / cksumSeconds : 0.0;
    state.counters["vs_floor"] = floorSeconds > 0.0 ? validateSeconds / floorSeconds : 0.0;
    state.counters["check_ms"] = validateSeconds * 1e3 / n;
    state.counters["cksum_ms"] = cksumSeconds * 1e3 / n;
    state.counters["floor_ms"] = floorSeconds * 1e3 / n;
}
#endif

const std::vector<unsigned char>& CrcData() {
    static const std::vector<unsigned char> data = [] {
        std::vector<unsigned char> bytes(kCrcSize);
        std::mt19937 random(7);
        for (auto& byte : bytes) {
            byte = static_cast<unsigned char>(random());
        }
        return bytes;
    }();
    return data;
}

void BM_Crc32_Port(benchmark::State& state) {
    const auto& data = CrcData();
    for (auto _ : state) {
        benchmark::DoNotOptimize(Port::StringBase<char>::CRC32(0, data.data(), data.size()));
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(data.size() * state.iterations()));
    state.SetLabel(Port::StringBase<char>::CRC32Implementation());
}

#if defined(TESU_BENCH_ISAL)
void BM_Crc32_Isal(benchmark::State& state) {
    const auto& data = CrcData();
    for (auto _ : state) {
        benchmark::DoNotOptimize(crc32_gzip_refl(0, data.data(), data.size()));
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(data.size() * state.iterations()));
}

// The layer's CRC-32 and ISA-L's over the same data, timed side by side.
void BM_Crc32_PortVersusIsal(benchmark::State& state) {
    const auto& data = CrcData();
    double portSeconds = 0.0;
    double isalSeconds = 0.0;
    for (auto _ : state) {
        const auto start = CpuSeconds();
        benchmark::DoNotOptimize(Port::StringBase<char>::CRC32(0, data.data(), data.size()));
        const auto middle = CpuSeconds();
        benchmark::DoNotOptimize(crc32_gzip_refl(0, data.data(), data.size()));
        const auto end = CpuSeconds();
        portSeconds += middle - start;
        isalSeconds += end - middle;
    }
    state.counters["vs_isal"] = portSeconds > 0.0 ? isalSeconds / portSeconds : 0.0;
    state.SetLabel(Port::StringBase<char>::CRC32Implementation());
}
#endif

#if defined(TESU_BENCH_LIBDEFLATE)
void BM_Crc32_Libdeflate(benchmark::State& state) {
    const auto& data = CrcData();
    for (auto _ : state) {
        benchmark::DoNotOptimize(libdeflate_crc32(0, data.data(), data.size()));
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(data.size() * state.iterations()));
}
#endif

void BM_Crc32_Zlib(benchmark::State& state) {
    const auto& data = CrcData();
    for (auto _ : state) {
        benchmark::DoNotOptimize(crc32(0L, data.data(), static_cast<uInt>(data.size())));
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(data.size() * state.iterations()));
}

// A list of 10,000 existing members in a few subdirectories.
const std::string& FileList() {
    static const std::string path = [] {
        const fs::path directory = DataDirectory() / "list";
        std::string content = "# generated members\n";
        for (int i = 0; i < kListMembers; ++i) {
            const std::string member =
                "group" + std::to_string(i % 10) + "/member" + std::to_string(i) + ".v";
            fs::create_directories((directory / member).parent_path());
            std::ofstream(directory / member).put('\n');
            content += member + (i % 7 == 0 ? "  # with a comment\n" : "\n");
        }
        const std::string name = (directory / "files.lst").string();
        std::ofstream(name) << content;
        return name;
    }();
    return path;
}

void BM_FileListFileStrings(benchmark::State& state) {
    const Port::FileName list(FileList().c_str());
    for (auto _ : state) {
        const auto members = Tesu::Utilities::GetFileListFileStrings(list);
        if (members.size() != static_cast<std::size_t>(kListMembers)) {
            state.SkipWithError("members missing from the list");
            return;
        }
    }
    state.counters["per_member"] = benchmark::Counter(
        kListMembers, benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

// One stat of each member of the list, by the path the list gives it: the floor under reading
// the list, which asks the system about every member once.
void BM_StatPerMember(benchmark::State& state) {
    const fs::path directory = fs::path(FileList()).parent_path();
    std::vector<std::string> paths;
    for (int i = 0; i < kListMembers; ++i) {
        paths.push_back(
            (directory / ("group" + std::to_string(i % 10) + "/member" + std::to_string(i) + ".v"))
                .string());
    }
    for (auto _ : state) {
        for (const std::string& path : paths) {
            struct stat info {};
            if (::stat(path.c_str(), &info) != 0) {
                state.SkipWithError("a member is missing");
                return;
            }
        }
    }
    state.counters["per_member"] = benchmark::Counter(
        kListMembers, benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

}  // namespace

BENCHMARK(BM_FreadFile)->Unit(benchmark::kMillisecond)->MinTime(2.0);
BENCHMARK(BM_ReadAndCrcFloor)->Unit(benchmark::kMillisecond)->MinTime(2.0);
BENCHMARK(BM_ValidateFileChecksum)->Unit(benchmark::kMillisecond)->MinTime(2.0);
#if defined(TESU_CKSUM)
BENCHMARK(BM_ValidateVersusCksum)->Unit(benchmark::kMillisecond)->Iterations(10);
#endif
BENCHMARK(BM_Crc32_Port)->Unit(benchmark::kMillisecond);
#if defined(TESU_BENCH_ISAL)
BENCHMARK(BM_Crc32_Isal)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Crc32_PortVersusIsal)->Unit(benchmark::kMillisecond)->Iterations(40);
#endif
#if defined(TESU_BENCH_LIBDEFLATE)
BENCHMARK(BM_Crc32_Libdeflate)->Unit(benchmark::kMillisecond);
#endif
BENCHMARK(BM_Crc32_Zlib)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FileListFileStrings)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_StatPerMember)->Unit(benchmark::kMillisecond);

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    std::error_code ignored;
    fs::remove_all(DataDirectory(), ignored);
    return 0;
}
