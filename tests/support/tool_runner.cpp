#include "tests/support/tool_runner.h"

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <sstream>

#include <fcntl.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace testing_support {
namespace {

// The words that start the tool with `args`: toolPrefix(), the tool, `args`.
std::vector<std::string> toolCommand(const std::vector<std::string>& args) {
    std::vector<std::string> words(toolPrefix());
    words.push_back(LSC_BINARY);
    words.insert(words.end(), args.begin(), args.end());
    return words;
}

// In the child: runs the tool in `dir`; never returns.
[[noreturn]] void execTool(const std::vector<std::string>& args, const std::string& dir) {
    std::vector<std::string> words = toolCommand(args);
    std::vector<char*> argv;
    for (std::string& word : words)
        argv.push_back(word.data());
    argv.push_back(nullptr);
    if (!dir.empty() && chdir(dir.c_str()) != 0)
        _exit(127);
    execvp(argv[0], argv.data()); // the emulator may be named without a path
    _exit(127);
}

} // namespace

const std::vector<std::string>& toolPrefix() {
#ifdef LSC_TOOL_PREFIX
    static const std::vector<std::string> prefix{LSC_TOOL_PREFIX};
#else
    static const std::vector<std::string> prefix;
#endif
    return prefix;
}

std::string toolCommandPrefix() {
    std::string command;
    for (const std::string& word : toolPrefix()) {
        command += '\'';
        for (char c : word)
            command += c == '\'' ? std::string("'\\''") : std::string(1, c);
        command += "' ";
    }
    return command;
}

pid_t startTool(const std::vector<std::string>& args, const std::string& dir) {
    const pid_t pid = fork();
    if (pid == 0) {
        const int none = open("/dev/null", O_RDWR);
        for (int fd : {0, 1, 2})
            dup2(none, fd);
        execTool(args, dir);
    }
    return pid;
}

int exitStatus(pid_t pid) {
    int status = 0;
    waitpid(pid, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

ToolResult runTool(const std::vector<std::string>& args, const std::string& dir,
                   const std::string& input, long maxFileBytes) {
    std::FILE* in = std::tmpfile();
    std::fwrite(input.data(), 1, input.size(), in);
    std::rewind(in);
    int out[2], err[2];
    if (pipe(out) != 0 || pipe(err) != 0)
        return {};
    const pid_t pid = fork();
    if (pid == 0) {
        dup2(fileno(in), 0);
        dup2(out[1], 1);
        dup2(err[1], 2);
        for (int fd : {out[0], out[1], err[0], err[1]})
            close(fd);
        if (maxFileBytes > 0) {
            // Without this the first write past the limit would kill the tool.
            std::signal(SIGXFSZ, SIG_IGN);
            const rlimit limit = {static_cast<rlim_t>(maxFileBytes),
                                  static_cast<rlim_t>(maxFileBytes)};
            if (setrlimit(RLIMIT_FSIZE, &limit) != 0)
                _exit(127);
        }
        execTool(args, dir);
    }
    close(out[1]);
    close(err[1]);
    std::fclose(in);
    // Both pipes are read as they fill, so a chatty run cannot block on one.
    ToolResult result;
    pollfd fds[2] = {{out[0], POLLIN, 0}, {err[0], POLLIN, 0}};
    std::string* texts[2] = {&result.out, &result.err};
    for (int open = 2; open > 0;) {
        if (poll(fds, 2, -1) < 0 && errno != EINTR)
            break;
        for (int i = 0; i < 2; ++i) {
            if (fds[i].fd < 0 || fds[i].revents == 0)
                continue;
            char chunk[4096];
            const ssize_t n = read(fds[i].fd, chunk, sizeof chunk);
            if (n > 0) {
                texts[i]->append(chunk, static_cast<std::size_t>(n));
            } else {
                close(fds[i].fd);
                fds[i].fd = -1;
                --open;
            }
        }
    }
    result.status = exitStatus(pid);
    return result;
}

std::vector<std::string> words(const std::string& text) {
    std::vector<std::string> result;
    std::istringstream in(text);
    for (std::string word; in >> word;)
        result.push_back(word);
    return result;
}

} // namespace testing_support
