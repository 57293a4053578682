#include "support/TestBroker.h"

#include <arpa/inet.h>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <fstream>
#include <netinet/in.h>
#include <pwd.h>
#include <sstream>
#include <stdexcept>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace qv::test {
namespace {

constexpr const char* kBrokerProgram = "/usr/sbin/mosquitto";
constexpr const char* kPasswdProgram = "/usr/bin/mosquitto_passwd";

sockaddr_in LoopbackAddress(std::uint16_t port)
{
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    return address;
}

std::string CurrentUserName()
{
    if (const passwd* entry = getpwuid(geteuid()))
        return entry->pw_name;
    return "root";
}

void WriteFile(const std::filesystem::path& path, const std::string& text)
{
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out << text;
    if (!out)
        throw std::runtime_error("cannot write " + path.string());
}

// Runs a program to completion with its output discarded; its exit status.
int RunQuietly(const std::vector<std::string>& arguments)
{
    const pid_t child = fork();
    if (child < 0)
        throw std::runtime_error("fork failed");
    if (child == 0) {
        const int null = open("/dev/null", O_RDWR);
        dup2(null, STDOUT_FILENO);
        dup2(null, STDERR_FILENO);
        std::vector<char*> argv;
        for (const auto& argument : arguments)
            argv.push_back(const_cast<char*>(argument.c_str()));
        argv.push_back(nullptr);
        execv(argv[0], argv.data());
        _exit(127);
    }
    int status = 0;
    while (waitpid(child, &status, 0) < 0 && errno == EINTR) {
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

} // namespace

std::uint16_t FreeLoopbackPort()
{
    const int fd = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (fd < 0)
        throw std::runtime_error("socket failed");
    sockaddr_in address = LoopbackAddress(0);
    socklen_t length = sizeof address;
    if (bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0
        || getsockname(fd, reinterpret_cast<sockaddr*>(&address), &length) != 0) {
        close(fd);
        throw std::runtime_error("cannot find a free loopback port");
    }
    close(fd);
    return ntohs(address.sin_port);
}

TestBroker::TestBroker(TestBrokerOptions options) : options_(std::move(options))
{
    std::string pattern = (std::filesystem::temp_directory_path() / "varoscope-broker-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr)
        throw std::runtime_error("mkdtemp failed");
    directory_ = pattern;
    try {
        port_ = FreeLoopbackPort();
        WriteFiles();
        Start();
    } catch (...) {
        Stop();
        std::error_code ignored;
        std::filesystem::remove_all(directory_, ignored);
        throw;
    }
}

TestBroker::~TestBroker()
{
    Stop();
    std::error_code ignored;
    std::filesystem::remove_all(directory_, ignored);
}

void TestBroker::WriteFiles()
{
    std::ostringstream config;
    config << "listener " << port_ << " 127.0.0.1\n"
           << "persistence false\n"
           << "user " << CurrentUserName() << "\n"
           << "log_dest file " << (directory_ / "broker.log").string() << "\n"
           << "log_type all\n"
           << "connection_messages true\n"
           << "set_tcp_nodelay " << (options_.tcpNoDelay ? "true" : "false") << "\n";
    if (options_.users.empty()) {
        config << "allow_anonymous true\n";
    } else {
        std::string lines;
        for (const auto& [user, password] : options_.users)
            lines += user + ":" + password + "\n";
        const auto passwordFile = directory_ / "passwords";
        WriteFile(passwordFile, lines);
        chmod(passwordFile.c_str(), 0600);
        if (RunQuietly({kPasswdProgram, "-U", passwordFile.string()}) != 0)
            throw std::runtime_error("mosquitto_passwd -U failed");
        config << "allow_anonymous false\n"
               << "password_file " << passwordFile.string() << "\n";
    }
    if (!options_.acl.empty()) {
        const auto aclFile = directory_ / "acl";
        WriteFile(aclFile, options_.acl);
        chmod(aclFile.c_str(), 0600);
        config << "acl_file " << aclFile.string() << "\n";
    }
    config << options_.extraConfig << "\n";
    WriteFile(directory_ / "mosquitto.conf", config.str());
}

bool TestBroker::AcceptsConnections() const
{
    const int fd = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (fd < 0)
        return false;
    const sockaddr_in address = LoopbackAddress(port_);
    const bool connected = connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
    close(fd);
    return connected;
}

void TestBroker::Start()
{
    if (pid_ > 0)
        return;
    const std::string program = kBrokerProgram;
    const std::string configFile = (directory_ / "mosquitto.conf").string();
    const std::string outputFile = (directory_ / "broker.out").string();
    const pid_t parent = getpid();
    const pid_t child = fork();
    if (child < 0)
        throw std::runtime_error("fork failed");
    if (child == 0) {
        // Dies with the test, even when the test is killed.
        prctl(PR_SET_PDEATHSIG, SIGKILL);
        if (getppid() != parent)
            _exit(126);
        const int out = open(outputFile.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
        if (out >= 0) {
            dup2(out, STDOUT_FILENO);
            dup2(out, STDERR_FILENO);
        }
        execl(program.c_str(), program.c_str(), "-c", configFile.c_str(), static_cast<char*>(nullptr));
        _exit(127);
    }
    pid_ = child;

    // A restart may briefly find the port still held by the old broker.
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(5);
    while (std::chrono::steady_clock::now() < deadline) {
        int status = 0;
        if (waitpid(pid_, &status, WNOHANG) == pid_) {
            pid_ = -1;
            throw std::runtime_error("mosquitto exited at start:\n" + Log());
        }
        if (AcceptsConnections())
            return;
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    Stop();
    throw std::runtime_error("mosquitto did not accept connections:\n" + Log());
}

void TestBroker::Stop()
{
    if (pid_ <= 0)
        return;
    kill(pid_, SIGTERM);
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(3);
    int status = 0;
    for (;;) {
        const pid_t done = waitpid(pid_, &status, WNOHANG);
        if (done == pid_ || (done < 0 && errno == ECHILD))
            break;
        if (std::chrono::steady_clock::now() >= deadline) {
            kill(pid_, SIGKILL);
            while (waitpid(pid_, &status, 0) < 0 && errno == EINTR) {
            }
            break;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    pid_ = -1;
}

void TestBroker::Restart()
{
    Stop();
    Start();
}

std::string TestBroker::Log() const
{
    std::string text;
    for (const char* name : {"broker.out", "broker.log"}) {
        std::ifstream in(directory_ / name, std::ios::binary);
        std::ostringstream content;
        content << in.rdbuf();
        text += content.str();
    }
    return text;
}

} // namespace qv::test
