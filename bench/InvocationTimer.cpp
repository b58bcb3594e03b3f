// Times whole command invocations, interleaved, and reports medians, ratios to a baseline,
// processor time and peak memory.
//
//   bench_invocation RUNS CASE...
//   CASE:  --case LABEL [--env NAME=VALUE]... -- PROGRAM ARGS... --end
//
// Each round runs every case once, in order, so that a drift of the machine's speed touches all
// cases alike. The first case is the baseline of the ratios. Wall time is what a user waits
// for; processor time (user and system) shows the work itself, which a busy machine inflates
// less. Standard output and error of the programs are discarded; a case whose program exits
// non-zero is reported and fails the run.
#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace {

struct Case {
    std::string label;
    std::vector<std::string> env;
    std::vector<std::string> argv;
    std::vector<double> millis;
    std::vector<double> cpuMillis;
    long maxRssKiB = 0;
    int failures = 0;
};

double Millis(const timeval& t) {
    return double(t.tv_sec) * 1e3 + double(t.tv_usec) / 1e3;
}

// Runs the case once and records its times.
void RunOnce(Case& c) {
    std::vector<char*> argv;
    for (auto& a : c.argv) argv.push_back(a.data());
    argv.push_back(nullptr);

    const auto start = std::chrono::steady_clock::now();
    pid_t pid = fork();
    if (pid < 0) {
        perror("fork");
        exit(2);
    }
    if (pid == 0) {
        int devnull = open("/dev/null", O_RDWR);
        dup2(devnull, 0);
        dup2(devnull, 1);
        dup2(devnull, 2);
        for (auto& e : c.env) putenv(e.data());
        execvp(argv[0], argv.data());
        _exit(127);
    }
    int status = 0;
    struct rusage usage {};
    if (wait4(pid, &status, 0, &usage) < 0) {
        perror("wait4");
        exit(2);
    }
    const auto end = std::chrono::steady_clock::now();
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) ++c.failures;
    c.maxRssKiB = std::max(c.maxRssKiB, usage.ru_maxrss);
    c.millis.push_back(std::chrono::duration<double, std::milli>(end - start).count());
    c.cpuMillis.push_back(Millis(usage.ru_utime) + Millis(usage.ru_stime));
}

double Median(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    const size_t n = values.size();
    return n % 2 ? values[n / 2] : (values[n / 2 - 1] + values[n / 2]) / 2;
}

int Usage() {
    fprintf(stderr,
            "usage: bench_invocation RUNS --case LABEL [--env NAME=VALUE]... -- PROGRAM ARGS... "
            "--end ...\n");
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 2) return Usage();
    const int runs = atoi(argv[1]);
    if (runs <= 0) return Usage();

    std::vector<Case> cases;
    for (int i = 2; i < argc;) {
        if (strcmp(argv[i], "--case") != 0 || i + 1 >= argc) return Usage();
        Case c;
        c.label = argv[i + 1];
        i += 2;
        while (i + 1 < argc && strcmp(argv[i], "--env") == 0) {
            c.env.emplace_back(argv[i + 1]);
            i += 2;
        }
        if (i >= argc || strcmp(argv[i], "--") != 0) return Usage();
        ++i;
        while (i < argc && strcmp(argv[i], "--end") != 0) c.argv.emplace_back(argv[i++]);
        if (i >= argc || c.argv.empty()) return Usage();
        ++i;
        cases.push_back(std::move(c));
    }
    if (cases.empty()) return Usage();

    for (auto& c : cases) {  // warm the caches once, untimed
        RunOnce(c);
        c.millis.clear();
        c.cpuMillis.clear();
        c.failures = 0;
        c.maxRssKiB = 0;
    }
    for (int round = 0; round < runs; ++round) {
        for (auto& c : cases) RunOnce(c);
    }

    const double baseline = Median(cases.front().millis);
    const double baselineCpu = Median(cases.front().cpuMillis);
    printf("%-44s %9s %8s %6s %8s %6s %8s\n", "case", "median ms", "min ms", "ratio", "cpu ms",
           "ratio", "RSS KiB");
    bool failed = false;
    for (const auto& c : cases) {
        const double median = Median(c.millis);
        const double cpu = Median(c.cpuMillis);
        printf("%-44s %9.2f %8.2f %6.2f %8.2f %6.2f %8ld%s\n", c.label.c_str(), median,
               *std::min_element(c.millis.begin(), c.millis.end()), median / baseline, cpu,
               cpu / baselineCpu, c.maxRssKiB, c.failures ? "  (FAILED)" : "");
        failed |= c.failures != 0;
    }
    return failed ? 1 : 0;
}
