// A small HTTP server on a loopback port of its own, with answers by path.
#pragma once

#include <arpa/inet.h>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <functional>
#include <map>
#include <mutex>
#include <netinet/in.h>
#include <stdexcept>
#include <string>
#include <string_view>
#include <sys/socket.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace xquery {

class HTTPServer {
 public:
  // What a handler writes its answer to.
  class Connection {
   public:
    Connection(int socket, const std::atomic<bool>& isStopping)
        : _socket(socket), _isStopping(isStopping) {}
    // Whether the other side still listens.
    bool send(std::string_view bytes) {
      while (!bytes.empty()) {
        if (_isStopping) return false;
        const ssize_t count = ::send(_socket, bytes.data(), bytes.size(), MSG_NOSIGNAL);
        if (count <= 0) return false;
        bytes.remove_prefix(static_cast<size_t>(count));
      }
      return true;
    }
    // Says nothing until the other side gives up.
    void waitForEnd() {
      char byte = 0;
      while (!_isStopping && ::recv(_socket, &byte, 1, 0) > 0) {
      }
    }
    // One byte now and then, until the other side gives up.
    void trickle() {
      while (send("x")) std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    // As much as the other side takes.
    void pour() {
      const std::string piece(65536, 'x');
      while (send(piece)) {
      }
    }

   private:
    int _socket;
    const std::atomic<bool>& _isStopping;
  };
  using Handler = std::function<void(Connection&)>;

  HTTPServer() {
    // A proxy that the environment names is not to be asked for what is on this machine.
    ::setenv("no_proxy", "*", 1);
    _listener = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in address = {};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof address;
    auto* const plain = reinterpret_cast<sockaddr*>(&address);
    if (_listener < 0 || ::bind(_listener, plain, length) != 0 || ::listen(_listener, 64) != 0 ||
        ::getsockname(_listener, plain, &length) != 0) {
      throw std::runtime_error("no loopback port");
    }
    _port = ntohs(address.sin_port);
    _thread = std::thread([this] { acceptAll(); });
  }
  ~HTTPServer() {
    _isStopping = true;
    ::shutdown(_listener, SHUT_RDWR);
    _thread.join();
    {
      const std::lock_guard lock(_mutex);
      for (const int socket : _sockets) ::shutdown(socket, SHUT_RDWR);
    }
    for (std::thread& each : _connections) each.join();
    ::close(_listener);
  }
  HTTPServer(const HTTPServer&) = delete;
  HTTPServer& operator=(const HTTPServer&) = delete;

  std::string URL(std::string_view path) const {
    return "http://127.0.0.1:" + std::to_string(_port) + std::string(path);
  }
  void handle(const std::string& path, Handler handler) {
    const std::lock_guard lock(_mutex);
    _handlers[path] = std::move(handler);
  }
  // `header` lines end in "\r\n".
  void answer(const std::string& path, int status, const std::string& header,
              const std::string& body) {
    handle(path, [=](Connection& connection) {
      connection.send("HTTP/1.1 " + std::to_string(status) + " Reason\r\n" + header +
                      "Content-Length: " + std::to_string(body.size()) +
                      "\r\nConnection: close\r\n\r\n" + body);
    });
  }
  void answer(const std::string& path, const std::string& type, const std::string& body) {
    answer(path, 200, "Content-Type: " + type + "\r\n", body);
  }
  void redirect(const std::string& path, const std::string& target, int status = 302) {
    answer(path, status, "Location: " + target + "\r\n", "");
  }
  // How often the path was asked for, query included.
  int requests(const std::string& path) {
    const std::lock_guard lock(_mutex);
    return _counts[path];
  }
  int requests() {
    const std::lock_guard lock(_mutex);
    int sum = 0;
    for (const auto& [path, count] : _counts) sum += count;
    return sum;
  }

 private:
  void acceptAll() {
    for (;;) {
      const int socket = ::accept4(_listener, nullptr, nullptr, SOCK_CLOEXEC);
      if (socket < 0) return;
      const std::lock_guard lock(_mutex);
      _sockets.push_back(socket);
      _connections.emplace_back([this, socket] { serve(socket); });
    }
  }

  void serve(int socket) {
    std::string request;
    char piece[4096];
    while (request.find("\r\n\r\n") == request.npos) {
      const ssize_t count = ::recv(socket, piece, sizeof piece, 0);
      if (count <= 0) break;
      request.append(piece, static_cast<size_t>(count));
    }
    const size_t start = request.find(' ') + 1;
    const std::string path = request.substr(start, request.find(' ', start) - start);
    Handler handler;
    {
      const std::lock_guard lock(_mutex);
      ++_counts[path];
      if (const auto found = _handlers.find(path); found != _handlers.end()) {
        handler = found->second;
      }
    }
    Connection connection(socket, _isStopping);
    if (handler) {
      handler(connection);
    } else {
      connection.send("HTTP/1.1 404 Missing\r\nContent-Length: 0\r\nConnection: close\r\n\r\n");
    }
    const std::lock_guard lock(_mutex);
    std::erase(_sockets, socket);
    ::close(socket);
  }

  int _listener = -1;
  int _port = 0;
  std::atomic<bool> _isStopping = false;
  std::thread _thread;
  std::mutex _mutex;
  std::map<std::string, Handler> _handlers;
  std::map<std::string, int> _counts;
  std::vector<int> _sockets;
  std::vector<std::thread> _connections;
};

}  // namespace xquery
