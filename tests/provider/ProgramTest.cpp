#include <gtest/gtest.h>
#include <httplib.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace {

using nlohmann::json;

// The program, ended with the object.
class Program {
public:
    explicit Program(std::vector<std::string> arguments) {
        std::array<int, 2> pipe{};
        if (::pipe(pipe.data()) != 0) return;
        mPid = fork();
        if (mPid == 0) {
            dup2(pipe[1], STDOUT_FILENO);
            close(pipe[0]);
            close(pipe[1]);
            arguments.insert(arguments.begin(), VPS_BIN_DIR "/vantor-pim-provider");
            std::vector<char*> argv;
            argv.reserve(arguments.size() + 1);
            for (std::string& argument : arguments) argv.push_back(argument.data());
            argv.push_back(nullptr);
            execv(argv[0], argv.data());
            _exit(127);
        }
        close(pipe[1]);
        mOut = fdopen(pipe[0], "r");
    }
    ~Program() {
        if (mPid > 0) end(SIGKILL);
        if (mOut != nullptr) std::fclose(mOut);
    }
    Program(const Program&) = delete;
    Program& operator=(const Program&) = delete;

    std::string line() {
        std::string text;
        for (int c = std::fgetc(mOut); c != EOF && c != '\n'; c = std::fgetc(mOut))
            text += static_cast<char>(c);
        return text;
    }

    // Sends the signal, none for 0, and waits. The exit status.
    int end(int signal) {
        int status = -1;
        if (signal != 0) kill(mPid, signal);
        waitpid(mPid, &status, 0);
        mPid = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

private:
    pid_t mPid = -1;
    std::FILE* mOut = nullptr;
};

TEST(ProviderProgram, KeepsItsContentInTheStateFile) {
    const std::filesystem::path state =
        std::filesystem::temp_directory_path() / ("provider-state-" + std::to_string(getpid()));
    std::filesystem::remove(state);
    json before;
    for (const int signal : {SIGTERM, SIGINT}) {
        Program program({"--seed", "sample", "--quiet", "--state", state});
        const json ready = json::parse(program.line());
        EXPECT_EQ(ready.at("accounts").size(), 2U);
        httplib::Client client(ready.at("url").get<std::string>());
        client.set_keep_alive(true);  // an idle connection must not delay the end
        const json dump = json::parse(client.Get("/admin/dump")->body);
        if (before.is_null()) {
            EXPECT_EQ(client.Delete("/admin/calendars/first@provider.example/events/gym00")->status, 200);
            before = json::parse(client.Get("/admin/dump")->body);
        } else {
            EXPECT_TRUE(dump.at("accounts") == before.at("accounts"));
            EXPECT_TRUE(dump.at("calendars")[0].at("events") == before.at("calendars")[0].at("events"));
        }
        EXPECT_EQ(program.end(signal), 0);
    }
    std::filesystem::remove(state);
}

TEST(ProviderProgram, SaysWhyItDoesNotStart) {
    EXPECT_EQ(Program({"--port", "70000"}).end(0), 2);
    EXPECT_EQ(Program({"--seed", "/no/such/file"}).end(0), 1);
    Program first({"--seed", "1", "--quiet"});
    const std::string url = json::parse(first.line()).at("url");
    EXPECT_EQ(Program({"--seed", "1", "--port", url.substr(url.rfind(':') + 1)}).end(0), 1);
}

}  // namespace
