// Reads one movie on 8 threads, records on 17 and appends to two movies on two, all at once. Built with the thread
// sanitizer, which reports what is not safe.
//
//     threads FOLDER ROUNDS
//
// Prints how many streams were read, recorded and appended; ends with 1 where one of them is wrong.

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <atomic>
#include <barrier>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <iterator>
#include <map>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

using namespace ZULMetaData;
using namespace ZULMetaData::Test;

namespace {

constexpr int s_readers = 8;
constexpr int s_movies = 2;

std::atomic<int> s_right = 0;
std::atomic<int> s_wrong = 0;

void expect(bool isRight) {
    ++(isRight ? s_right : s_wrong);
}

std::string contentsOf(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void writeFile(const std::string& path, const std::string& contents) {
    std::ofstream(path, std::ios::binary) << contents;
}

/// Calls `visit.template operator()<S>()` for every kind.
template <class Visit>
void forEachKind(Visit visit) {
    [&]<class... S>(std::tuple<S...>*) { (visit.template operator()<S>(), ...); }(static_cast<EveryKind*>(nullptr));
}

std::string movieOfEveryKind() {
    std::vector<std::string> streams;
    forEachKind([&]<class S>() { streams.push_back(goldenStream<S>()); });
    return media() + zulmAtom(streams);
}

void readEveryKind(const std::string& movie) {
    forEachKind([&]<class S>() { expect(asTexts(*typename S::Parser(movie).read()) == goldenEntries<S>()); });
}

template <class S>
void recordKind(const std::string& file) {
    typename S::Writer writer(file);
    recordSamples<S>(writer);
    finish(writer);
    expect(contentsOf(file) == recordedStream<S>());
}

void append(const std::string& movie, const std::vector<std::string>& files) {
    writeFile(movie, media());
    expect(MP4MetaData::appendMetaDataFiles(movie, files));
    expect(Util::finalizeAtomsInFile(movie));
    expect(contentsOf(movie) == media() + zulmAtom({locationStream(), appNameStream()}));
}

/// What each thread does, again and again.
std::vector<std::function<void()>> tasks(const std::string& folder) {
    const std::string movie = folder + "/Recording.mp4";
    const std::vector<std::string> files{folder + "/Locations.dat", folder + "/Names.dat"};
    writeFile(movie, movieOfEveryKind());
    writeFile(files[0], locationStream());
    writeFile(files[1], appNameStream());
    std::vector<std::function<void()>> all(s_readers, [movie] { readEveryKind(movie); });
    forEachKind([&]<class S>() {
        const std::string file = folder + "/" + std::string(S::name) + ".dat";
        all.emplace_back([file] { recordKind<S>(file); });
    });
    for (int number = 0; number < s_movies; ++number)
        all.emplace_back([=] { append(folder + "/Movie" + std::to_string(number) + ".mp4", files); });
    return all;
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 3)
        return 2;
    const auto all = tasks(argv[1]);
    const int rounds = std::atoi(argv[2]);
    std::barrier start(static_cast<std::ptrdiff_t>(all.size()));
    {
        std::vector<std::jthread> threads;
        for (const auto& task : all)
            threads.emplace_back([&start, &task, rounds] {
                for (int round = 0; round < rounds; ++round) {
                    start.arrive_and_wait();
                    task();
                }
            });
    }
    std::printf("%d right, %d wrong\n", s_right.load(), s_wrong.load());
    return s_wrong == 0 ? 0 : 1;
}
