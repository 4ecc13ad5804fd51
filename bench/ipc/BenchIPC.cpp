// benchIPC JOB RIVAL PLACE: measures one job once, with a receiver of its own, and prints the figure.
// bench/ipc/run calls it in turns. benchIPC list prints what was built; benchIPC payload APPLICATIONS prints
// the bytes themselves; benchIPC JOB ours PLACE NUMBER measures how our cost grows.

#include "bench/ipc/Codec.h"
#include "bench/ipc/Growth.h"
#include "bench/ipc/Pair.h"
#include "bench/ipc/Payloads.h"
#include "platform/linux/SealedMemory.h"

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iostream>
#include <malloc.h>
#include <map>
#include <sched.h>
#include <unistd.h>

std::vector<Rival>& Rivals() {
    static std::vector<Rival> rivals;
    return rivals;
}

std::vector<NamedCodec>& Codecs() {
    static std::vector<NamedCodec> codecs;
    return codecs;
}

namespace {

void UseOneProcessor() {
    cpu_set_t set;
    CPU_ZERO(&set);
    CPU_SET(1, &set);
    sched_setaffinity(0, sizeof set, &set);
}

/// Microseconds of a message of 200 bytes and its answer.
double RoundTrip(const Rival& rival, const std::string& place) {
    UseOneProcessor();
    Pair pair(rival, place);
    const auto payload = MenuRefresh(55);
    Times times;
    for (int i = 0; i < 20'000; ++i)
        times.push_back(TimeOf([&] { pair.sender().send(payload, true); }));
    times.erase(times.begin(), times.begin() + 1000);
    return Median(times);
}

/// Microseconds a message, of many that are on the way together.
double OneWay(const Rival& rival, const std::string& place) {
    constexpr std::uint64_t count = 100'000, ahead = 8'192;
    Pair pair(rival, place);
    const auto payload = MenuRefresh(55);
    const auto before = pair.board().handled.load();
    const auto start = Board::now();
    for (std::uint64_t i = 0; i < count; ++i) {
        pair.sender().send(payload, false);
        if (i % 256 == 0 && i > ahead) pair.awaitHandled(before + i - ahead);
    }
    pair.awaitHandled(before + count);
    return static_cast<double>(pair.board().handledAt - start) / 1000 / count;
}

/// Until the receiver has given back what it held: a sender that fills memory meanwhile takes half again as
/// long, and which end it is that gives it back differs.
void RestAfter(const Payload& payload) {
    Rest(300 + static_cast<int>(payload.bytes.size() / 500));
}

template <int applications>
double Visible(const Rival& rival, const std::string& place) {
    Pair pair(rival, place);
    const auto payload = MenuUpdate(applications, applications == 3000 ? listWidth : allWidths);
    Times times;
    for (int i = 0; i < 10; ++i) {
        times.push_back(pair.timeToHandle(payload));
        RestAfter(payload);
    }
    times.erase(times.begin(), times.begin() + 2);
    return Median(times);
}

template <int applications, bool allSizes>
double Update(const Rival& rival, const std::string& place) {
    Pair pair(rival, place);
    const auto payload = MenuUpdate(applications, allSizes ? allWidths : listWidth);
    Times times;
    for (int i = 0; i < (allSizes ? 8 : 52); ++i) {
        times.push_back(pair.timeToHandle(payload));
        RestAfter(payload);
    }
    times.erase(times.begin(), times.begin() + 2);
    return Median(times);
}

/// The slowest of 1,000 sends to a receiver that is stopped, beyond what writing the payload takes.
double Stopped(const Rival& rival, const std::string& place) {
    Pair pair(rival, place);
    kill(pair.receiver(), SIGSTOP);
    double worst = 0;
    for (const auto& payload : {MenuRefresh(55), MenuUpdate(60, listWidth)}) {
        Times writes, sends;
        const std::span<const std::byte> bytes = payload.bytes;
        for (int i = 0; i < 200; ++i)
            writes.push_back(TimeOf([&] { platform::WriteSealedMemory({&bytes, 1}); }));
        for (int i = 0; i < 5'000; ++i)
            sends.push_back(TimeOf([&] { pair.sender().send(payload, false); }));
        worst = std::max(worst, Quantile(sends, 0.999) - Median(writes));
    }
    kill(pair.receiver(), SIGKILL);
    return worst;
}

double Copy() {
    const auto payload = MenuUpdate(400, allWidths);
    std::vector<std::byte> to(payload.bytes.size());
    Times times;
    for (int i = 0; i < 12; ++i)
        times.push_back(TimeOf([&] { std::memcpy(to.data(), payload.bytes.data(), to.size()); }));
    return Median(times);
}

std::size_t PeakMemory() {
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);)
        if (line.starts_with("VmHWM:")) return std::strtoul(line.c_str() + 6, nullptr, 10) * 1024;
    return 0;
}

/// Reading, writing, the bytes that come of it, and the most memory that reading took.
void MeasureCodec(Codec& codec, int applications) {
    const auto payload = MenuUpdate(applications, allWidths);
    Times reads, writes;
    std::size_t size = 0;
    malloc_trim(0);                              // what the process has free would hide what reading takes
    std::ofstream("/proc/self/clear_refs") << 5; // forgets the peak
    const auto before = PeakMemory();
    codec.read(payload);
    const auto peak = PeakMemory() - before;
    for (int i = 0; i < 20; ++i) {
        codec.forget();
        reads.push_back(TimeOf([&] { codec.read(payload); }));
        writes.push_back(TimeOf([&] { size = codec.write(payload); }));
    }
    std::cout << Median(reads) << ' ' << Median(writes) << ' ' << size << ' ' << peak << '\n';
}

using Job = double (*)(const Rival&, const std::string&);
const std::map<std::string, Job> jobs{
    {"round trip", RoundTrip},
    {"one way", OneWay},
    {"8 MB", Visible<100>},
    {"32 MB", Visible<400>},
    {"60, 32 px", Update<60, false>},
    {"300, 32 px", Update<300, false>},
    {"1000, 32 px", Update<1000, false>},
    {"60, all", Update<60, true>},
    {"300, all", Update<300, true>},
    {"1000, all", Update<1000, true>},
    {"stopped", Stopped},
};
const std::map<std::string, double (*)(const std::string&, std::size_t)> growths{
    {"size", CostOfSize},
    {"clients", CostOfClients},
    {"observers", CostOfObservers},
    {"inline", CostOfInline},
    {"in memory", CostOfMemory},
    {"amid floods", CostAmidFloods},
    {"slowest amid floods", SlowestAmidFloods},
};

} // namespace

int main(int count, char* words[]) {
    const std::string job = count > 1 ? words[1] : "list", who = count > 2 ? words[2] : "";
    if (job == "list")
        for (const auto& rival : Rivals())
            std::cout << rival.name << '\n';
    if (job == "memcpy") std::cout << Copy() << '\n';
    if (job == "payload") {
        const auto payload = MenuUpdate(std::atoi(who.c_str()), allWidths);
        std::cout.write(reinterpret_cast<const char*>(payload.bytes.data()),
                        static_cast<std::streamsize>(payload.bytes.size()));
    }
    for (const auto& codec : Codecs())
        if (job == "codec" && who == codec.name) MeasureCodec(*codec.make(), 300);
    if (growths.contains(job) && count > 4)
        std::cout << growths.at(job)(words[3], static_cast<std::size_t>(std::atol(words[4]))) << std::endl;
    if (!jobs.contains(job) || count < 4) return 0;
    for (const auto& rival : Rivals())
        if (who == rival.name) std::cout << jobs.at(job)(rival, words[3]) << std::endl;
    _exit(0); // the libraries of others may wait at exit for those who were killed
}
