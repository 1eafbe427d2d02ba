// Servers on this machine that make their clients wait.
#pragma once

#include <arpa/inet.h>
#include <netinet/in.h>
#include <string>
#include <sys/socket.h>
#include <thread>
#include <unistd.h>

namespace bench {

// Takes connections, since the system does so for it, and says nothing.
class SilentServer {
 public:
  SilentServer() : _socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address = {};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof address;
    auto* const plain = reinterpret_cast<sockaddr*>(&address);
    if (::bind(_socket, plain, length) == 0 && ::listen(_socket, 64) == 0 &&
        ::getsockname(_socket, plain, &length) == 0) {
      _port = ntohs(address.sin_port);
    }
  }
  ~SilentServer() { ::close(_socket); }
  SilentServer(const SilentServer&) = delete;
  SilentServer& operator=(const SilentServer&) = delete;

  std::string URL() const { return "http://127.0.0.1:" + std::to_string(_port) + "/"; }

 protected:
  int _socket;

 private:
  int _port = 0;
};

// Answers without an end, one client after another, as long as the process lives.
class EndlessServer : public SilentServer {
 public:
  EndlessServer() {
    std::thread([socket = _socket] {
      const std::string head = "HTTP/1.1 200 OK\r\nContent-Type: application/xml\r\n\r\n<r>";
      const std::string piece(65536, ' ');
      for (;;) {
        const int client = ::accept(socket, nullptr, nullptr);
        if (client < 0) return;
        ::send(client, head.data(), head.size(), MSG_NOSIGNAL);
        while (::send(client, piece.data(), piece.size(), MSG_NOSIGNAL) > 0) {
        }
        ::close(client);
      }
    }).detach();
  }
};

}  // namespace bench
