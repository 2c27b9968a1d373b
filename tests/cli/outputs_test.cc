// What ovmacro does to the files it is asked to write when they are not plain files, or are fought over: the
// cases that a golden case cannot set up (devices, FIFOs, links, modes, permissions, signals, races).
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "support/test_support.h"

namespace orvan {
namespace {

namespace fs = std::filesystem;
using testing::ReadFile;
using testing::RunTool;
using testing::TempDir;

// A folder's entries in name order: "name=content" for a file (with its mode unless it is 644), "name->target"
// for a symlink, "name|" for a FIFO, "name!" for a device, and each subfolder's entries after "name/".
std::string Describe(const fs::path& dir, const std::string& prefix = "") {
    std::vector<fs::path> entries(fs::directory_iterator(dir), fs::directory_iterator{});
    std::sort(entries.begin(), entries.end());
    std::string out;
    for (const fs::path& p : entries) {
        struct stat st {};
        lstat(p.c_str(), &st);
        const std::string name = prefix + p.filename().string();
        char mode[16];
        std::snprintf(mode, sizeof mode, "(%o)", st.st_mode & 07777);
        out += S_ISLNK(st.st_mode)   ? name + "->" + fs::read_symlink(p).string() + " "
               : S_ISFIFO(st.st_mode) ? name + "| "
               : S_ISCHR(st.st_mode)  ? name + "! "
               : S_ISDIR(st.st_mode)  ? Describe(p, name + "/")
                                      : name + ((st.st_mode & 07777) == 0644 ? "" : mode) + "=" + ReadFile(p) + " ";
    }
    return out;
}

TEST(OutputFiles, NeverReplaceWhatIsNoPlainFileAndKeepWhatIsAsked) {
    const struct {
        const char* name;
        std::function<void(const TempDir&)> setUp;
        std::vector<std::string> args;
        int exitCode;
        std::string after;  // Describe() of the folder after the run (t.ovm holds "new")
    } cases[] = {
        // Root gets a null device of its own, so that a fault cannot replace the system's /dev/null.
        {"a device is written, not replaced",
         [](const TempDir& d) { ASSERT_EQ(mknod((d.path() / "null").c_str(), S_IFCHR | 0666, makedev(1, 3)), 0); },
         {"-o", "null", "t.ovm"}, 0, "null! t.ovm=new "},
        {"a symlink is followed, and a dangling one gets its target",
         [](const TempDir& d) {
             d.Write("real/out.txt", "old");
             fs::create_symlink("real/out.txt", d.path() / "link"), fs::create_symlink("made", d.path() / "dangling");
         },
         {"-o", "link", "--deps", "dangling", "t.ovm"}, 0, "dangling->made link->real/out.txt made=link: t.ovm\n "
                                                          "real/out.txt=new t.ovm=new "},
        {"a replaced file keeps its mode; its other hard links keep the old content",
         [](const TempDir& d) {
             fs::permissions(d.Write("run.sh", "old"), fs::perms(0751));
             fs::create_hard_link(d.path() / "run.sh", d.path() / "other");
         },
         {"-o", "run.sh", "t.ovm"}, 0, "other(751)=old run.sh(751)=new t.ovm=new "},
        {"the old fixed temporary names, planted as a symlink or a file, are left alone",
         [](const TempDir& d) {
             d.Write("victim", "precious"), d.Write("b.ovmacro-tmp", "mine");
             fs::create_symlink("victim", d.path() / "a.ovmacro-tmp");
         },
         {"-o", "a", "--deps", "b", "t.ovm"}, 0,
         "a=new a.ovmacro-tmp->victim b=a: t.ovm\n b.ovmacro-tmp=mine t.ovm=new victim=precious "},
        {"one output that cannot be written keeps the others from being replaced",
         [](const TempDir& d) { d.Write("q.txt", "old q"), d.Write("q.d", "old d"), d.Write("map/x", ""); },
         {"-o", "q.txt", "--deps", "q.d", "--source-map", "map", "t.ovm"}, 2, "map/x= q.d=old d q.txt=old q t.ovm=new "},
        {"a name as long as the file system allows", nullptr, {"-o", std::string(255, 'n'), "t.ovm"}, 0,
         std::string(255, 'n') + "=new t.ovm=new "},
        {"an empty name is no name", nullptr, {"-o", "", "t.ovm"}, 2, "t.ovm=new "},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        if (geteuid() != 0 && c.after.rfind("null!", 0) == 0) continue;  // only root makes devices
        TempDir dir;
        dir.Write("t.ovm", "new");
        if (c.setUp) c.setUp(dir);
        const testing::ToolResult r = RunTool(c.args, "", dir.path().string());
        EXPECT_EQ(r.exitCode, c.exitCode) << r.err;
        EXPECT_EQ(Describe(dir.path()), c.after);
    }
}

TEST(OutputFiles, AFifoIsWrittenNotReplaced) {
    TempDir dir;
    dir.Write("t.ovm", "through the pipe");
    ASSERT_EQ(mkfifo((dir.path() / "fifo").c_str(), 0644), 0);
    std::string received;
    std::thread reader([&] { received = ReadFile(dir.path() / "fifo"); });
    EXPECT_EQ(RunTool({"-o", "fifo", "t.ovm"}, "", dir.path().string()).exitCode, 0);
    reader.join();
    EXPECT_EQ(received, "through the pipe");
    EXPECT_EQ(Describe(dir.path()), "fifo| t.ovm=through the pipe ");
}

// Where the folder may not be written but OUT may, OUT is rewritten in place. Root writes anywhere, so the
// tool then runs as nobody.
TEST(OutputFiles, AWritableFileInAReadOnlyFolderIsUpdatedInPlace) {
    TempDir dir;
    const std::string in = dir.Write("t.ovm", "new"), out = dir.Write("ro/out.txt", "old");
    fs::permissions(out, fs::perms(0666));
    fs::permissions(dir.path() / "ro", fs::perms(0555));
    const testing::Finally writable([&] { fs::permissions(dir.path() / "ro", fs::perms(0755)); });
    const std::vector<std::string> asNobody =
        geteuid() == 0 ? std::vector<std::string>{"setpriv", "--reuid=65534", "--regid=65534", "--clear-groups"}
                       : std::vector<std::string>{};
    if (RunTool({"--version"}, "", "", asNobody, nullptr).exitCode != 0)
        GTEST_SKIP() << "the tool cannot run as an unprivileged user from this folder";
    EXPECT_EQ(RunTool({"-o", out, in}, "", "", asNobody, nullptr).exitCode, 0);
    EXPECT_EQ(ReadFile(out), "new");
    // A file not there yet cannot be made, and the report says why.
    const std::string absent = (dir.path() / "ro/absent.txt").string();
    EXPECT_EQ(RunTool({"-o", absent, in}, "", "", asNobody, nullptr).err,
              "ovmacro: cannot write " + absent + ": Permission denied\n");
}

// A run ended by a signal while it works leaves OUT as it was and no file of its own behind.
TEST(OutputFiles, AKilledRunLeavesNothingBehind) {
    for (const int signal : {SIGTERM, SIGKILL, SIGINT}) {
        TempDir dir;
        dir.Write("t.ovm", "@let int i = 0\n@while(true){@let i = i + 1\nline i\n}\n");
        dir.Write("out.txt", "old");
        const std::string before = Describe(dir.path());
        const auto stop = [&](int pid) {
            std::this_thread::sleep_for(std::chrono::milliseconds(200));
            kill(pid, signal);
        };
        EXPECT_EQ(RunTool({"--max-output", "1G", "-o", "out.txt", "t.ovm"}, "", dir.path().string(), {}, stop).exitCode,
                  128 + signal);
        EXPECT_EQ(Describe(dir.path()), before);
    }
}

// A large expansion goes into OUT's temporary file as it is made, from a large input mapped where it needs no
// line-end conversion: OUT gets what standard output gets, and a failure late in the run leaves OUT as it was.
TEST(OutputFiles, LargeExpansionsStreamIntoOutAndFailuresLeaveItAlone) {
    std::string lines;
    for (int i = 0; i < 20000; ++i) lines += "a line of plain text, long enough to fill the buffers\n";
    std::string doubling = "@def d0 = {0123456789abcdef}\n";
    for (int i = 1; i <= 15; ++i) doubling += "@def d" + std::to_string(i) + " = {d" + std::to_string(i - 1) + " d" +
                                                std::to_string(i - 1) + "}\n";
    const struct {
        std::string text;
        std::string expected;  // OUT afterwards, or "old" when the run fails
    } cases[] = {
        {lines, lines},
        {"cr\rlf\r\n" + lines, "cr\rlf\n" + lines},  // read, not mapped: each CR LF becomes LF
        {doubling + "d15\n", ""},                     // as standard output has it
        {lines + "@fail(\"late\")\n", "old"},
        {doubling + "d15\n@fail(\"late\")\n", "old"},
    };
    for (const auto& c : cases) {
        TempDir dir;
        dir.Write("t.ovm", c.text);
        dir.Write("out.txt", "old");
        const testing::ToolResult toStdout = RunTool({"t.ovm"}, "", dir.path().string());
        const testing::ToolResult r = RunTool({"-o", "out.txt", "t.ovm"}, "", dir.path().string());
        EXPECT_EQ(r.exitCode, c.expected == "old" ? 1 : 0) << r.err;
        EXPECT_EQ(r.err, toStdout.err);
        EXPECT_EQ(ReadFile(dir.path() / "out.txt"), c.expected.empty() ? toStdout.out : c.expected);
        // d15 is 32768 times 16 characters and the blanks between them.
        EXPECT_EQ(fs::file_size(dir.path() / "out.txt"), c.expected.empty() ? 557056u : c.expected.size());
        EXPECT_EQ(std::distance(fs::directory_iterator(dir.path()), fs::directory_iterator{}), 2);
    }
}

// A large input is mapped; when another process shortens it during the run, the run ends with a message, not
// a crash, and writes nothing. The template waits, in Python, until the test has shortened it.
TEST(OutputFiles, AnInputShortenedDuringTheRunEndsItAndWritesNothing) {
    TempDir dir;
    std::string text = "@runpython{\n  import os, time\n  open('ready', 'w').close()\n";
    text += "  while not os.path.exists('go'): time.sleep(0.01)\n}\n";
    for (int i = 0; i < 20000; ++i) text += "a line of plain text to fill the pages\n";
    dir.Write("t.ovm", text);
    dir.Write("out.txt", "old");
    const auto shorten = [&](int) {
        for (int i = 0; i < 1000 && !fs::exists(dir.path() / "ready"); ++i)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        fs::resize_file(dir.path() / "t.ovm", 0);
        dir.Write("go", "");
    };
    const testing::ToolResult r = RunTool({"-o", "out.txt", "t.ovm"}, "", dir.path().string(), {}, shorten);
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.err, "ovmacro: an input file was shortened while it was read; nothing was written\n");
    EXPECT_EQ(Describe(dir.path()), "go= out.txt=old ready= t.ovm= ");
}

// Runs that write the same OUT at once each leave one whole file: OUT is always one run's whole expansion.
TEST(OutputFiles, ConcurrentRunsNeverMixTheirOutputs) {
    TempDir dir;
    dir.Write("t.ovm", "@let int i = 0\n@while(i < 20000){@let i = i + 1\nW line i of a long enough output\n}\n");
    std::vector<std::string> whole;
    for (const char* w : {"A", "B", "C"})
        whole.push_back(RunTool({"-D", std::string("W=") + w, "t.ovm"}, "", dir.path().string()).out);
    for (int round = 0; round < 8; ++round) {
        std::vector<std::thread> runs;
        for (const char* w : {"A", "B", "C"})
            runs.emplace_back([&, w] { RunTool({"-D", std::string("W=") + w, "-o", "out", "t.ovm"}, "", dir.path()); });
        for (std::thread& t : runs) t.join();
        const std::string out = ReadFile(dir.path() / "out");
        EXPECT_TRUE(out == whole[0] || out == whole[1] || out == whole[2]) << "a mixture of " << out.size() << " bytes";
        EXPECT_EQ(Describe(dir.path()).substr(0, 4), "out=") << "no temporary file";
    }
}

// --restricted follows symlinks before it decides whether an import lies inside the permitted folders.
TEST(Restricted, SymlinksOutOfThePermittedFoldersAreRefused) {
    TempDir dir;
    dir.Write("outside/secret.ovm", "$KEY = \"hidden\"\n");
    dir.Write("in/lib/ok.ovm", "@def X = fine\n");
    dir.Write("in/t.ovm", "@import \"link.ovm\"\n");
    dir.Write("in/u.ovm", "@import \"inside/ok.ovm\"\nX\n");
    fs::create_symlink("../outside/secret.ovm", dir.path() / "in/link.ovm");
    fs::create_directory_symlink("lib", dir.path() / "in/inside");
    testing::ToolResult r = RunTool({"--restricted", "--settings", "t.ovm"}, "", dir.path() / "in");
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.err, "\nt.ovm(1) : Import of link.ovm refused: it lies outside the folders allowed in restricted mode\n");
    r = RunTool({"--restricted", "u.ovm"}, "", dir.path() / "in");
    EXPECT_EQ(r.out, "fine\n") << "a link that stays inside is fine";
}

// Deep nesting ends in the nesting error, and long contexts are shortened: the report stays small.
TEST(Bounds, DeepNestingAndLongContextsEndInShortReports) {
    const auto nest = [](const std::string& open, const std::string& inside, const std::string& close) {
        std::string text;
        for (int i = 0; i < 20000; ++i) text += open;
        text += inside;
        for (int i = 0; i < 20000; ++i) text += close;
        return text;
    };
    for (const std::string& text :
         {nest("@if(true){", "1", "}"), nest("@scope{", "1", "}"), nest("@for(i in [1]){", "1", "}"),
          nest("@if(true)\n{\n", "1", "}\n"), nest("@[", "1", "]"), nest("@(", "1", ")"),
          "@def f(a) = {<a>}\n" + nest("f(", "x", ")")}) {
        const testing::ToolResult r = RunTool({}, text);
        EXPECT_EQ(r.exitCode, 1);
        EXPECT_NE(r.err.find("Macro expansion nested too deeply"), std::string::npos) << r.err.substr(0, 200);
        EXPECT_LT(r.err.size(), 20000u) << "context lines shortened and counted";
    }
}

// Running out of memory is a located error, never an abort. (AddressSanitizer cannot run in a small address
// space, so its build does not try.)
TEST(Bounds, OutOfMemoryIsAReportedError) {
#if defined(__SANITIZE_ADDRESS__)
    GTEST_SKIP() << "AddressSanitizer needs a large address space";
#endif
    const testing::ToolResult r =
        RunTool({"--max-output", "64G", "-"}, "x\n@let string s := xxxxxxxxxxxxxxxx\n@while(true){@let s := s s}\n",
                "", {"prlimit", "--as=400000000"}, nullptr);
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_NE(r.err.find("(3) : Out of memory"), std::string::npos) << r.err;
}

}  // namespace
}  // namespace orvan
