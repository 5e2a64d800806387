// Tree operations of Directories on a generated tree: GetTreeSize, CountEntries, CopyDirectory,
// RemoveDirectoryTree.
//
// Run without arguments: Google Benchmark on a small tree (20 folders of 50 files) in /tmp.
// Run as `bench_tree_bench --op <size|count|copy|remove> <native dir> [native destination]`:
// one operation on an existing tree, timed by the caller (bench/FileSystem/compare_tree.sh
// times it against du, find, cp and rm in the same run).
#include <benchmark/benchmark.h>
#include <stdlib.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>

#include "owutils/Directories.h"
#include "owutils/Exceptions.h"
#include "owutils/Paths.h"

namespace {

CString Library(const std::string& native) {
  std::u16string wide(native.begin(), native.end());  // the benchmark paths are ASCII
  return Paths::FromNativePath(CString(wide));
}

void MakeTree(const std::string& root, int folders, int files) {
  std::string content(100, 'x');
  for (int f = 0; f < folders; ++f) {
    std::string dir = root + "/d" + std::to_string(f);
    std::filesystem::create_directories(dir);
    for (int i = 0; i < files; ++i) std::ofstream(dir + "/f" + std::to_string(i)) << content;
  }
}

struct SmallTree {
  SmallTree() {
    char pattern[] = "/tmp/owutils-bench-XXXXXX";
    root = mkdtemp(pattern);
    MakeTree(root + "/src", 20, 50);
  }
  ~SmallTree() { std::filesystem::remove_all(root); }
  std::string root;
};

SmallTree& Tree() {
  static SmallTree tree;
  return tree;
}

void BM_GetTreeSize(benchmark::State& state) {
  CString dir = Library(Tree().root + "/src");
  for (auto _ : state) {
    bool stop = false;
    benchmark::DoNotOptimize(Directories::GetTreeSize(dir, stop));
  }
  state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * 1020);
}
BENCHMARK(BM_GetTreeSize)->Unit(benchmark::kMillisecond);

void BM_CountEntries(benchmark::State& state) {
  CString dir = Library(Tree().root + "/src");
  for (auto _ : state) {
    bool stop = false;
    ULONGLONG dirs = 0, files = 0;
    Directories::CountEntries(dir, true, stop, dirs, files);
    benchmark::DoNotOptimize(files);
  }
  state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * 1020);
}
BENCHMARK(BM_CountEntries)->Unit(benchmark::kMillisecond);

void BM_CopyThenRemove(benchmark::State& state) {
  CString source = Library(Tree().root + "/src");
  CString copy = Library(Tree().root + "/copy");
  for (auto _ : state) {
    Directories::CopyDirectory(source, copy);
    Directories::RemoveDirectoryTree(copy);
  }
  state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * 1020);
}
BENCHMARK(BM_CopyThenRemove)->Unit(benchmark::kMillisecond);

int RunOne(int argc, char** argv) {
  if (argc < 4) {
    std::fprintf(stderr, "usage: %s --op <size|count|copy|remove> <dir> [destination]\n", argv[0]);
    return 2;
  }
  std::string op = argv[2];
  CString dir = Library(argv[3]);
  try {
    bool stop = false;
    if (op == "size") {
      std::printf("%llu\n", static_cast<unsigned long long>(Directories::GetTreeSize(dir, stop)));
    } else if (op == "count") {
      ULONGLONG dirs = 0, files = 0;
      Directories::CountEntries(dir, true, stop, dirs, files);
      std::printf("%llu\n", static_cast<unsigned long long>(dirs + files));
    } else if (op == "copy" && argc >= 5) {
      Directories::CopyDirectory(dir, Library(argv[4]));
    } else if (op == "remove") {
      Directories::RemoveDirectoryTree(dir);
    } else {
      return 2;
    }
  } catch (LumoException::Exception& e) {
    std::u16string text = e.ToString();
    std::fprintf(stderr, "%s\n", std::string(text.begin(), text.end()).c_str());
    return 1;
  }
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  // The benchmark trees live in /tmp: the default drive map reaches them.
  setenv("OWUTILS_DRIVES", "C=/", 1);
  if (argc >= 2 && std::strcmp(argv[1], "--op") == 0) return RunOne(argc, argv);
  benchmark::Initialize(&argc, argv);
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
