#include "tests/support/tool_runner.h"

#include <cstdio>
#include <cstdlib>

#include "tests/support/temp_dir.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace testing_support {

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

std::vector<std::string> toolCommand(const std::vector<std::string>& args) {
    std::vector<std::string> words(toolPrefix());
    words.push_back(LSC_BINARY);
    words.insert(words.end(), args.begin(), args.end());
    return words;
}

std::vector<char*> argumentVector(std::vector<std::string>& words) {
    std::vector<char*> argv;
    for (std::string& word : words)
        argv.push_back(word.data());
    argv.push_back(nullptr);
    return argv;
}

ToolResult runTool(const std::vector<std::string>& args, const std::string& dir,
                   const std::string& input) {
    std::FILE* out = std::tmpfile();
    std::FILE* err = std::tmpfile();
    std::FILE* in = std::tmpfile();
    std::fwrite(input.data(), 1, input.size(), in);
    std::rewind(in);

    std::vector<std::string> words = toolCommand(args);
    std::vector<char*> argv = argumentVector(words);

    ToolResult result;
    const pid_t pid = fork();
    if (pid == 0) {
        dup2(fileno(in), 0);
        dup2(fileno(out), 1);
        dup2(fileno(err), 2);
        if (!dir.empty() && chdir(dir.c_str()) != 0)
            _exit(127);
        execvp(argv[0], argv.data()); // the emulator may be named without a path
        _exit(127);
    }
    int status = 0;
    waitpid(pid, &status, 0);
    if (WIFEXITED(status))
        result.status = WEXITSTATUS(status);
    result.out = readStream(out);
    result.err = readStream(err);
    std::fclose(out);
    std::fclose(err);
    std::fclose(in);
    return result;
}

} // namespace testing_support
