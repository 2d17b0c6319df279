// Spawns a program with both streams going to temporary files.
#include "tools/render/program_run.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdio>

namespace tessaly {

namespace {

std::string contentOf(std::FILE* file) {
    std::rewind(file);
    std::string text;
    for (int c = std::fgetc(file); c != EOF; c = std::fgetc(file)) {
        text.push_back(static_cast<char>(c));
    }
    return text;
}

}  // namespace

ProgramRun interruptProgram(const std::string& program,
                            const std::vector<std::string>& arguments,
                            const std::function<bool()>& ready) {
    std::vector<std::string> words = {program};
    words.insert(words.end(), arguments.begin(), arguments.end());
    std::vector<char*> pointers;
    for (std::string& word : words) {
        pointers.push_back(word.data());
    }
    pointers.push_back(nullptr);

    std::FILE* output = std::tmpfile();
    std::FILE* errors = std::tmpfile();
    posix_spawn_file_actions_t actions{};
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, fileno(output), STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, fileno(errors), STDERR_FILENO);
    pid_t child = 0;
    ProgramRun run;
    if (posix_spawn(&child, program.c_str(), &actions, nullptr, pointers.data(), environ) == 0) {
        if (ready) {
            // WNOWAIT: a program that ends early is still collected below.
            siginfo_t ended{};
            while (!ready() &&
                   waitid(P_PID, static_cast<id_t>(child), &ended, WEXITED | WNOHANG | WNOWAIT) ==
                       0 &&
                   ended.si_pid == 0) {
                usleep(1000);
            }
            kill(child, SIGTERM);
        }
        int status = 0;
        if (waitpid(child, &status, 0) == child && WIFEXITED(status)) {
            run.exitCode = WEXITSTATUS(status);
        }
    }
    posix_spawn_file_actions_destroy(&actions);
    run.output = contentOf(output);
    run.errors = contentOf(errors);
    std::fclose(output);
    std::fclose(errors);
    return run;
}

ProgramRun runProgram(const std::string& program, const std::vector<std::string>& arguments) {
    return interruptProgram(program, arguments, nullptr);
}

}  // namespace tessaly
