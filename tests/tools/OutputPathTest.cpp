// Every output of every command, written to whatever its path names: a plain file is
// replaced whole (keeping its mode, owner and links), a link's target is written and the link
// kept, a device, a terminal or a named pipe is written through and stays what it is, the
// command's own standard output is its standard output; an output that is one of the inputs
// or another output is refused before anything is read; an interrupted run leaves the old
// output whole and no temporary file.
//
// What each command writes is the same whatever the output is, so each case compares with
// the same command writing to a new plain file (the recording and the stand-in plug-in give
// the same text every time).

#include <fcntl.h>
#include <poll.h>
#include <pty.h>
#include <signal.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstring>
#include <functional>
#include <thread>

#include "ToolTestSupport.h"

extern char** environ;

namespace orvane::tooltest {
namespace {

std::string fakePlugIn() { return std::string("ORVANE_PLUGIN_PATH=") + kFakePlugInDirectory; }

// One output option of one command: the arguments that write to PATH.
struct OutputOption {
    const char* name;
    std::function<std::vector<std::string>(const std::string& input, const std::string& path)> args;
};

void PrintTo(const OutputOption& option, std::ostream* os) { *os << option.name; }

const OutputOption kOutputs[] = {
    {"replay_events_out",
     [](const std::string& in, const std::string& p) { return std::vector<std::string>{"replay", in, "--events-out", p}; }},
    {"replay_log_out",
     [](const std::string& in, const std::string& p) { return std::vector<std::string>{"replay", in, "--log-out", p}; }},
    {"replay_html",
     [](const std::string& in, const std::string& p) { return std::vector<std::string>{"replay", in, "--html", p}; }},
    {"frames_out",
     [](const std::string& in, const std::string& p) { return std::vector<std::string>{"frames", in, "--out", p}; }},
};

struct FileStatus {
    bool exists = false;
    struct stat st {};
};

FileStatus lstatOf(const std::string& path) {
    FileStatus s;
    s.exists = ::lstat(path.c_str(), &s.st) == 0;
    return s;
}

// The temporary files a run may have left in the folder.
std::vector<std::string> temporaryFiles(const ScratchFolder& scratch) {
    std::vector<std::string> out;
    for (const std::string& name : scratch.list())
        if (name.find(".tmp-") != std::string::npos) out.push_back(name);
    return out;
}

class OutputPath : public ::testing::TestWithParam<OutputOption> {
protected:
    void SetUp() override {
        // The bundled demonstration, copied so that its folder is the test's own.
        input_ = scratch_.write("session.frames.jsonl", readFile(kDemoRecording));
        expected_ = produce(scratch_.file("reference.out"));
        ASSERT_FALSE(expected_.empty());
    }

    CommandResult run(const std::string& path) const { return runOrvane(GetParam().args(input_, path), {fakePlugIn()}); }

    // What the command writes to a new plain file.
    std::string produce(const std::string& path) const {
        const CommandResult r = run(path);
        EXPECT_EQ(r.exitCode, 0) << r.err;
        return readFile(path);
    }

    ScratchFolder scratch_;
    std::string input_;
    std::string expected_;
};

TEST_P(OutputPath, ADeviceNodeIsWrittenThroughAndStaysADevice) {
    // A null device of the test's own: had it been replaced, only this copy would be lost.
    const std::string node = scratch_.file("null");
    if (::mknod(node.c_str(), S_IFCHR | 0666, makedev(1, 3)) != 0)
        GTEST_SKIP() << "device nodes cannot be made here (" << std::strerror(errno) << "): needs root";
    const int probe = ::open(node.c_str(), O_WRONLY);
    if (probe < 0) GTEST_SKIP() << "device nodes cannot be opened in " << scratch_.path() << " (mounted nodev)";
    ::close(probe);
    const CommandResult r = run(node);
    EXPECT_EQ(r.exitCode, 0) << r.err;
    const FileStatus after = lstatOf(node);
    ASSERT_TRUE(after.exists);
    EXPECT_TRUE(S_ISCHR(after.st.st_mode)) << "the device node was replaced";
    EXPECT_EQ(after.st.st_rdev, makedev(1, 3));
    EXPECT_EQ(temporaryFiles(scratch_), std::vector<std::string>{});
}

TEST_P(OutputPath, ATerminalIsWrittenThrough) {
    int master = -1, slave = -1;
    char name[256];
    if (::openpty(&master, &slave, name, nullptr, nullptr) != 0)
        GTEST_SKIP() << "no pseudo-terminal here (" << std::strerror(errno) << ")";
    struct termios raw {};
    ::tcgetattr(slave, &raw);
    ::cfmakeraw(&raw);  // the text as written, without the terminal's line-end translation
    ::tcsetattr(slave, TCSANOW, &raw);
    std::string received;
    std::thread reader([&] {
        char chunk[4096];
        while (received.size() < expected_.size()) {
            // A safety net only: a command that wrote too little must not hang the test.
            struct pollfd ready = {master, POLLIN, 0};
            if (::poll(&ready, 1, 10000) <= 0) break;
            const ssize_t n = ::read(master, chunk, sizeof chunk);
            if (n <= 0) break;
            received.append(chunk, static_cast<size_t>(n));
        }
    });
    const CommandResult r = run(name);
    EXPECT_EQ(r.exitCode, 0) << r.err;
    if (r.exitCode != 0) ::close(slave);  // ends the reader
    reader.join();
    struct stat st {};
    EXPECT_EQ(::stat(name, &st), 0);
    EXPECT_TRUE(S_ISCHR(st.st_mode)) << "the terminal was replaced";
    ::close(master);
    if (r.exitCode == 0) ::close(slave);
    EXPECT_EQ(received, expected_);
}

TEST_P(OutputPath, ANamedPipeIsWrittenThroughToItsReader) {
    const std::string fifo = scratch_.file("pipe");
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0) << std::strerror(errno);
    // Held open for writing too, so that reading waits for the command's text rather than
    // ending at once, and so that the pipe is still read if the command replaced its path.
    const int fd = ::open(fifo.c_str(), O_RDWR);
    ASSERT_GE(fd, 0);
    std::string received;
    std::atomic<bool> finished{false};
    std::thread reader([&] {
        char chunk[4096];
        for (;;) {
            struct pollfd ready = {fd, POLLIN, 0};
            if (::poll(&ready, 1, 20) <= 0) {
                if (finished) break;
                continue;
            }
            const ssize_t n = ::read(fd, chunk, sizeof chunk);
            if (n <= 0) break;
            received.append(chunk, static_cast<size_t>(n));
        }
    });
    const CommandResult r = run(fifo);
    finished = true;
    reader.join();
    ::close(fd);
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(received, expected_);
    EXPECT_TRUE(S_ISFIFO(lstatOf(fifo).st.st_mode)) << "the named pipe was replaced";
    EXPECT_EQ(temporaryFiles(scratch_), std::vector<std::string>{});
}

TEST_P(OutputPath, TheCommandsOwnStandardOutputByNameIsItsStandardOutput) {
    // The test captures standard output in a plain file: /dev/stdout reaches it through the
    // command's own descriptor, so the capture holds the output and stays the capture.
    const CommandResult r = run("/dev/stdout");
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, expected_);
}

TEST_P(OutputPath, ASymbolicLinkIsFollowedAndItsTargetReplaced) {
    const std::string target = scratch_.write("target.out", "old text\n");
    ASSERT_EQ(::chmod(target.c_str(), 0640), 0);
    ASSERT_EQ(::symlink("target.out", scratch_.file("link").c_str()), 0);
    ASSERT_EQ(::symlink("link", scratch_.file("link-to-link").c_str()), 0);
    const CommandResult r = run(scratch_.file("link-to-link"));
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_TRUE(S_ISLNK(lstatOf(scratch_.file("link")).st.st_mode));
    EXPECT_TRUE(S_ISLNK(lstatOf(scratch_.file("link-to-link")).st.st_mode));
    const FileStatus written = lstatOf(target);
    EXPECT_TRUE(S_ISREG(written.st.st_mode));
    EXPECT_EQ(written.st.st_mode & 07777, 0640u);
    EXPECT_EQ(readFile(target), expected_);
    EXPECT_EQ(temporaryFiles(scratch_), std::vector<std::string>{});
}

TEST_P(OutputPath, ALinkToNothingYetMakesItsTarget) {
    ASSERT_EQ(::symlink("made.out", scratch_.file("dangling").c_str()), 0);
    const CommandResult r = run(scratch_.file("dangling"));
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_TRUE(S_ISLNK(lstatOf(scratch_.file("dangling")).st.st_mode));
    EXPECT_EQ(readFile(scratch_.file("made.out")), expected_);
}

TEST_P(OutputPath, AnExistingFileKeepsItsModeAndItsHardLinks) {
    const std::string file = scratch_.write("kept.out", "old text\n");
    ASSERT_EQ(::chmod(file.c_str(), 0604), 0);
    const std::string other = scratch_.file("other-name.out");
    ASSERT_EQ(::link(file.c_str(), other.c_str()), 0);
    const ino_t inode = lstatOf(file).st.st_ino;
    const CommandResult r = run(file);
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(lstatOf(file).st.st_mode & 07777, 0604u);
    EXPECT_EQ(lstatOf(file).st.st_ino, inode) << "a file with other names is written in place";
    EXPECT_EQ(readFile(file), expected_);
    EXPECT_EQ(readFile(other), expected_);
    EXPECT_EQ(temporaryFiles(scratch_), std::vector<std::string>{});
}

TEST_P(OutputPath, AFileOfAnotherOwnerKeepsItsOwnerGroupAndMode) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root can give a file another owner";
    const std::string file = scratch_.write("owned.out", "old text\n");
    ASSERT_EQ(::chown(file.c_str(), 65534, 65534), 0) << std::strerror(errno);
    ASSERT_EQ(::chmod(file.c_str(), 0640), 0);
    const CommandResult r = run(file);
    EXPECT_EQ(r.exitCode, 0) << r.err;
    const FileStatus after = lstatOf(file);
    EXPECT_EQ(after.st.st_uid, 65534u);
    EXPECT_EQ(after.st.st_gid, 65534u);
    EXPECT_EQ(after.st.st_mode & 07777, 0640u);
    EXPECT_EQ(readFile(file), expected_);
}

TEST_P(OutputPath, TheInputItselfIsRefusedUnderEveryName) {
    const std::string original = readFile(input_);
    ASSERT_EQ(::symlink("session.frames.jsonl", scratch_.file("alias").c_str()), 0);
    ASSERT_EQ(::link(input_.c_str(), scratch_.file("hard-link").c_str()), 0);
    const std::string dotted = scratch_.path() + "/./session.frames.jsonl";
    for (const std::string& output : {input_, dotted, scratch_.file("alias"), scratch_.file("hard-link")}) {
        const CommandResult r = run(output);
        EXPECT_EQ(r.exitCode, 2) << output;
        const std::string option = GetParam().args(input_, output)[2];
        EXPECT_EQ(r.err, "orvane: " + option + " " + output + " is the same file as INPUT " + input_ +
                             "; nothing was read or written\n");
        EXPECT_EQ(readFile(input_), original) << "the recording changed";
    }
    EXPECT_EQ(temporaryFiles(scratch_), std::vector<std::string>{});
}

INSTANTIATE_TEST_SUITE_P(EveryOutput, OutputPath, ::testing::ValuesIn(kOutputs),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(OutputPaths, AnEvemuDescriptionIsAnInputToo) {
    ScratchFolder scratch;
    const std::string events = scratch.write("pad.events", "E: 0.000000 0000 0000 0000\n");
    const std::string description = scratch.write("pad.desc", "N: pad\n");
    const CommandResult beside = runOrvane({"frames", events, "--out", description});
    EXPECT_EQ(beside.exitCode, 2);
    EXPECT_EQ(beside.err, "orvane: --out " + description + " is the same file as the description " + description +
                              "; nothing was read or written\n");
    const std::string other = scratch.write("other.desc", "N: pad\n");
    const CommandResult given = runOrvane({"frames", events, "--desc", other, "--out", other});
    EXPECT_EQ(given.exitCode, 2);
    EXPECT_EQ(given.err, "orvane: --out " + other + " is the same file as --desc " + other +
                             "; nothing was read or written\n");
    EXPECT_EQ(readFile(description), "N: pad\n");
    EXPECT_EQ(readFile(other), "N: pad\n");
}

TEST(OutputPaths, StandardInputThatIsTheOutputFileIsRefused) {
    ScratchFolder scratch;
    const std::string recording = scratch.write("session.frames.jsonl", readFile(kDemoRecording));
    const std::string err = scratch.file("err");
    const std::string command = shellQuote(kOrvaneCommand) + " frames - --out " + shellQuote(recording) + " <" +
                                shellQuote(recording) + " 2>" + shellQuote(err);
    const int status = std::system(command.c_str());
    ASSERT_TRUE(WIFEXITED(status));
    EXPECT_EQ(WEXITSTATUS(status), 2);
    EXPECT_EQ(readFile(err), "orvane: --out " + recording +
                                 " is the same file as INPUT - (standard input); nothing was read or written\n");
    EXPECT_EQ(readFile(recording), readFile(kDemoRecording));
}

TEST(OutputPaths, TwoOutputsOfOneFileAreRefused) {
    ScratchFolder scratch;
    const std::string a = scratch.file("a.jsonl");
    const CommandResult files = runOrvane({"replay", "--events-out", a, "--log-out", scratch.path() + "/./a.jsonl"},
                                          {fakePlugIn()});
    EXPECT_EQ(files.exitCode, 2);
    EXPECT_EQ(files.err, "orvane: --events-out " + a + " and --log-out " + scratch.path() +
                             "/./a.jsonl are the same output; give each one of its own\n");
    EXPECT_FALSE(fileExists(a));
    const CommandResult standard = runOrvane({"replay", "--events-out", "-", "--html", "/dev/stdout"}, {fakePlugIn()});
    EXPECT_EQ(standard.exitCode, 2);
    EXPECT_EQ(standard.err, "orvane: --events-out - (standard output) and --html /dev/stdout are the same output; give "
                            "each one of its own\n");
    EXPECT_EQ(standard.out, "");
}

TEST(OutputPaths, TheNullDeviceMayTakeSeveralOutputs) {
    // A null device of the test's own, so that a fault cannot take the machine's.
    ScratchFolder scratch;
    const std::string node = scratch.file("null");
    if (::mknod(node.c_str(), S_IFCHR | 0666, makedev(1, 3)) != 0)
        GTEST_SKIP() << "device nodes cannot be made here (" << std::strerror(errno) << "): needs root";
    const CommandResult r =
        runOrvane({"replay", "--events-out", node, "--log-out", node, "--html", node}, {fakePlugIn()});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_TRUE(S_ISCHR(lstatOf(node).st.st_mode));
}

TEST(OutputPaths, AFolderIsNoOutput) {
    ScratchFolder scratch;
    const CommandResult r = runOrvane({"frames", kDemoRecording, "--out", scratch.path()});
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.err, scratch.path() + ": cannot be written (Is a directory)\n");
}

// A replay ended by SIGTERM half way: the old output whole, no temporary file left. The
// log stream goes to a named pipe the test stops reading after the first line, so the
// replay is sure to be in the middle of its records (its verbose log is far longer than a
// pipe holds) when the signal comes.
TEST(OutputPaths, AReplayEndedBySigtermLeavesTheOldOutputWhole) {
    ScratchFolder scratch;
    const std::string events = scratch.write("session.events.jsonl", "the old stream\n");
    const std::string fifo = scratch.file("log-pipe");
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0);
    // Open for writing too, so that reading waits for the replay's lines instead of seeing
    // the end of a pipe nobody has opened yet.
    const int reader = ::open(fifo.c_str(), O_RDWR);
    ASSERT_GE(reader, 0);

    std::vector<std::string> args = {kOrvaneCommand, "replay",    kDemoRecording, "--verbose",
                                     "--events-out", events,      "--log-out",    fifo};
    std::vector<char*> argv;
    for (std::string& a : args) argv.push_back(a.data());
    argv.push_back(nullptr);
    std::vector<std::string> env = {fakePlugIn(), "PATH=/usr/bin:/bin"};
    std::vector<char*> envp;
    for (std::string& e : env) envp.push_back(e.data());
    envp.push_back(nullptr);
    pid_t child = -1;
    ASSERT_EQ(::posix_spawn(&child, kOrvaneCommand, nullptr, nullptr, argv.data(), envp.data()), 0);
    struct ChildGuard {  // a failed assertion must not leave the replay running
        pid_t pid;
        ~ChildGuard() {
            if (pid > 0 && ::kill(pid, SIGKILL) == 0) ::waitpid(pid, nullptr, 0);
        }
    } guard{child};

    // The first log line of a record: the replay has opened its outputs and is under way.
    std::string firstLines;
    char chunk[256];
    while (firstLines.find("\"input\": 0") == std::string::npos) {
        struct pollfd ready = {reader, POLLIN, 0};
        ASSERT_GT(::poll(&ready, 1, 30000), 0) << "no log line from the replay";  // a safety net only
        const ssize_t n = ::read(reader, chunk, sizeof chunk);
        ASSERT_GT(n, 0);
        firstLines.append(chunk, static_cast<size_t>(n));
    }
    ASSERT_EQ(::kill(child, SIGTERM), 0);
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    guard.pid = -1;
    ::close(reader);
    ASSERT_TRUE(WIFSIGNALED(status)) << "the replay finished before the signal came";
    EXPECT_EQ(WTERMSIG(status), SIGTERM);
    EXPECT_EQ(readFile(events), "the old stream\n");
    EXPECT_EQ(temporaryFiles(scratch), std::vector<std::string>{});
}

}  // namespace
}  // namespace orvane::tooltest
