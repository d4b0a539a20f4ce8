#include "Fronts.h"

#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <stdexcept>

namespace TestSupport {

namespace {

const char* const NGINX = "/usr/sbin/nginx";
const int PORTS = 10;
const char* const HAPROXY = "/usr/sbin/haproxy";

/** Everything that nginx writes stays in the folder; one process, which a test can end. */
std::string mainFile(const std::string& folder, const std::string& included) {
    std::string text = "daemon off;\nmaster_process off;\nerror_log stderr notice;\npid " + folder +
                       "/pid;\nevents {}\n" + "http {\naccess_log off;\n";
    for (const char* const kind : {"client_body", "proxy", "fastcgi", "uwsgi", "scgi"}) {
        text += std::string(kind) + "_temp_path " + folder + "/" + kind + ";\n";
    }
    return text + "include " + included + ";\n}\n";
}

/** nginx says so when it listens. */
bool isReady(const std::string& output) {
    return output.find("event method") != std::string::npos;
}

void expectAccepted(const std::vector<std::string>& check,
                    const ChildProcess::Environment& environment) {
    const ChildProcess::Result result = ChildProcess::run(check, environment);
    EXPECT_EQ(0, result.exitStatus) << result.output;
}

}  // namespace

std::string deployFile(const std::string& name) {
    return std::string(PROJECT_DIR) + "/docs/deploy/" + name;
}

// The descriptor stays open in programs that the test starts: that is how it is handed over.
InheritedPort::InheritedPort() : descriptor(socket(AF_INET, SOCK_STREAM, 0)) {
    sockaddr_in address = {};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    auto* const place = reinterpret_cast<sockaddr*>(&address);
    if (bind(descriptor, place, size) != 0 || listen(descriptor, SOMAXCONN) != 0 ||
        getsockname(descriptor, place, &size) != 0) {
        throw std::runtime_error("no port");
    }
    port = ntohs(address.sin_port);
}

InheritedPort::~InheritedPort() {
    close(descriptor);
}

bool Nginx::isInstalled() {
    return std::filesystem::exists(NGINX);
}

Nginx::Nginx(const std::string& file, const std::string& listen, const std::string& gateways) {
    std::filesystem::create_directory(directory.path("talvox"));
    const bool isSecure = listen.find("ssl_certificate") != std::string::npos;
    directory.write("talvox/gateways.conf", gateways);
    const std::string main = directory.write("nginx.conf", mainFile(directory.path(), file));
    const std::vector<std::string> command = {NGINX, "-e", "stderr", "-p", directory.path(),
                                              "-c",  main};
    std::string output;
    // Another program may take the port before nginx does.
    for (int i = 0; i < PORTS && !isReady(output); ++i) {
        port = InheritedPort().getPort();
        directory.write("talvox/listen.conf", "listen 127.0.0.1:" + std::to_string(port) +
                                                  (isSecure ? " ssl;\n" : ";\n") + listen);
        program = std::make_unique<ChildProcess>(command);
        output.clear();
        for (std::string piece = program->read(); !piece.empty(); piece = program->read()) {
            output += piece;
            if (isReady(output)) {
                break;
            }
        }
    }
    EXPECT_TRUE(isReady(output)) << output;
}

bool Haproxy::isInstalled() {
    return std::filesystem::exists(HAPROXY);
}

Haproxy::Haproxy(const std::string& file, const std::string& certificate,
                 const std::vector<std::string>& gateways) {
    const InheritedPort inherited;
    port = inherited.getPort();
    ChildProcess::Environment environment = {
        {"TALVOX_LISTEN", "fd@" + std::to_string(inherited.getDescriptor())},
        {"TALVOX_CERTIFICATE", certificate},
        {"TALVOX_ADMIN", directory.path("admin.sock")}};
    for (std::size_t i = 0; i < gateways.size(); ++i) {
        environment.emplace_back("TALVOX_GATEWAY_" + std::to_string(i + 1), gateways[i]);
    }
    expectAccepted({HAPROXY, "-c", "-f", file}, environment);
    program = std::make_unique<ChildProcess>(std::vector<std::string>{HAPROXY, "-db", "-f", file},
                                             environment);
}

std::string Haproxy::command(const std::string& text) const {
    const int connection = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    std::strncpy(address.sun_path, directory.path("admin.sock").c_str(),
                 sizeof address.sun_path - 1);
    std::string answer;
    if (connect(connection, reinterpret_cast<sockaddr*>(&address), sizeof address) == 0) {
        const std::string line = text + "\n";
        send(connection, line.data(), line.size(), MSG_NOSIGNAL);
        char block[4096];
        for (ssize_t count = 0; (count = recv(connection, block, sizeof block, 0)) > 0;) {
            answer.append(block, static_cast<std::size_t>(count));
        }
    }
    close(connection);
    return answer;
}

}  // namespace TestSupport
