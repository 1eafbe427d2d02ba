#include "Platform/Loading/Curl.h"

#include "Platform/Loading/GatheredBytes.h"

#include <curl/curl.h>

#include <algorithm>
#include <limits>
#include <memory>
#include <mutex>
#include <new>
#include <sys/socket.h>

namespace xquery {

namespace {

// Of all headers of one response.
constexpr size_t mostHeaderBytes = size_t{1} << 20;
constexpr int checkpointMilliseconds = 50;

// Both kinds of handle are of one type to the compiler.
struct CleanUpMulti {
  void operator()(CURLM* handle) const { curl_multi_cleanup(handle); }
};
struct CleanUpEasy {
  void operator()(CURL* handle) const { curl_easy_cleanup(handle); }
};

// One request. Exceptions do not cross libcurl's C frames: a callback notes what went wrong and
// refuses its piece, which ends the transfer.
class Transfer {
 public:
  explicit Transfer(const CurlRequest& request)
      : _request(request), _multi(curl_multi_init()), _easy(curl_easy_init()) {
    if (!_multi || !_easy) throw std::bad_alloc();
  }
  ~Transfer() {
    if (_isAdded) curl_multi_remove_handle(_multi.get(), _easy.get());
  }
  Transfer(const Transfer&) = delete;
  Transfer& operator=(const Transfer&) = delete;

  std::optional<CurlResponse> run(std::string& failure);

 private:
  void configure();
  // Whether libcurl could be kept going to the end; how that was is the answer of the transfer.
  bool perform();
  CURLcode outcome();
  std::string reason(CURLcode code) const;
  void describeResponse();

  static size_t hearBody(char* bytes, size_t size, size_t count, void* self);
  static size_t hearHeader(char* bytes, size_t size, size_t count, void* self);
  static curl_socket_t openSocket(void* self, curlsocktype, curl_sockaddr* address);

  const CurlRequest& _request;
  const std::unique_ptr<CURLM, CleanUpMulti> _multi;
  const std::unique_ptr<CURL, CleanUpEasy> _easy;
  bool _isAdded = false;
  CurlResponse _response;
  GatheredBytes _body;
  size_t _headerBytes = 0;
  bool _isTooLong = false;
  bool _isForbidden = false;
  bool _isOutOfMemory = false;
  char _message[CURL_ERROR_SIZE] = {};
};

size_t Transfer::hearBody(char* bytes, size_t size, size_t count, void* self) {
  auto& transfer = *static_cast<Transfer*>(self);
  const size_t length = size * count;
  if (length > transfer._request.mostBytes - transfer._body.size()) {
    transfer._isTooLong = true;
    return CURL_WRITEFUNC_ERROR;
  }
  try {
    transfer._body.append({bytes, length});
  } catch (const std::bad_alloc&) {
    transfer._isOutOfMemory = true;
    return CURL_WRITEFUNC_ERROR;
  }
  return length;
}

size_t Transfer::hearHeader(char*, size_t size, size_t count, void* self) {
  auto& transfer = *static_cast<Transfer*>(self);
  transfer._headerBytes += size * count;
  if (transfer._headerBytes <= mostHeaderBytes) return size * count;
  transfer._isTooLong = true;
  return CURL_WRITEFUNC_ERROR;
}

// The address is that which the name stands for now, and which the connection will have.
curl_socket_t Transfer::openSocket(void* self, curlsocktype, curl_sockaddr* address) {
  auto& transfer = *static_cast<Transfer*>(self);
  if (!transfer._request.allowsAddress(address->addr)) {
    transfer._isForbidden = true;
    return CURL_SOCKET_BAD;
  }
  return ::socket(address->family, address->socktype | SOCK_CLOEXEC, address->protocol);
}

void Transfer::configure() {
  CURL* easy = _easy.get();
  const auto milliseconds = [](std::chrono::milliseconds time) {
    // Zero would mean no limit.
    return static_cast<long>(std::max<int64_t>(time.count(), 1));
  };
  curl_easy_setopt(easy, CURLOPT_ERRORBUFFER, _message);
  curl_easy_setopt(easy, CURLOPT_URL, _request.URL.c_str());
  curl_easy_setopt(easy, CURLOPT_PROTOCOLS_STR, "http,https");
  curl_easy_setopt(easy, CURLOPT_FOLLOWLOCATION, 0L);
  curl_easy_setopt(easy, CURLOPT_CONNECTTIMEOUT_MS, milliseconds(_request.connectTimeout));
  curl_easy_setopt(easy, CURLOPT_TIMEOUT_MS, milliseconds(_request.totalTimeout));
  // A body that is said to be longer is not waited for. Zero would mean no limit.
  curl_easy_setopt(easy, CURLOPT_MAXFILESIZE_LARGE,
                   static_cast<curl_off_t>(std::clamp<uint64_t>(
                       _request.mostBytes, 1, std::numeric_limits<int64_t>::max())));
  // A name that is still being looked up is not waited for when the transfer is given up.
  curl_easy_setopt(easy, CURLOPT_QUICK_EXIT, 1L);
  // Signals are the host's.
  curl_easy_setopt(easy, CURLOPT_NOSIGNAL, 1L);
  curl_easy_setopt(easy, CURLOPT_USERAGENT, "libxquery");
  curl_easy_setopt(easy, CURLOPT_WRITEFUNCTION, &Transfer::hearBody);
  curl_easy_setopt(easy, CURLOPT_WRITEDATA, this);
  curl_easy_setopt(easy, CURLOPT_HEADERFUNCTION, &Transfer::hearHeader);
  curl_easy_setopt(easy, CURLOPT_HEADERDATA, this);
  if (!_request.allowsAddress) return;
  curl_easy_setopt(easy, CURLOPT_PROXY, "");
  curl_easy_setopt(easy, CURLOPT_OPENSOCKETFUNCTION, &Transfer::openSocket);
  curl_easy_setopt(easy, CURLOPT_OPENSOCKETDATA, this);
}

bool Transfer::perform() {
  if (curl_multi_add_handle(_multi.get(), _easy.get()) != CURLM_OK) return false;
  _isAdded = true;
  for (int running = 1;;) {
    if (curl_multi_perform(_multi.get(), &running) != CURLM_OK) return false;
    if (running == 0) return true;
    if (_request.checkpoint) _request.checkpoint();
    if (curl_multi_poll(_multi.get(), nullptr, 0, checkpointMilliseconds, nullptr) != CURLM_OK) {
      return false;
    }
  }
}

CURLcode Transfer::outcome() {
  int left = 0;
  while (const CURLMsg* message = curl_multi_info_read(_multi.get(), &left)) {
    if (message->msg == CURLMSG_DONE) return message->data.result;
  }
  return CURLE_FAILED_INIT;
}

std::string Transfer::reason(CURLcode code) const {
  // A line of a header that is longer than it takes is out of memory to libcurl.
  if (_isTooLong || code == CURLE_OUT_OF_MEMORY || code == CURLE_FILESIZE_EXCEEDED) {
    return "more bytes than allowed";
  }
  if (_isForbidden) return "its address is not allowed";
  return _message[0] ? _message : curl_easy_strerror(code);
}

void Transfer::describeResponse() {
  long status = 0;
  curl_easy_getinfo(_easy.get(), CURLINFO_RESPONSE_CODE, &status);
  _response.statusCode = static_cast<int>(status);
  const char* text = nullptr;
  curl_easy_getinfo(_easy.get(), CURLINFO_CONTENT_TYPE, &text);
  if (text) _response.contentType = text;
  text = nullptr;
  curl_easy_getinfo(_easy.get(), CURLINFO_REDIRECT_URL, &text);
  const bool redirects =
      status == 301 || status == 302 || status == 303 || status == 307 || status == 308;
  if (text && redirects) _response.redirectURL = text;
}

std::optional<CurlResponse> Transfer::run(std::string& failure) {
  configure();
  const CURLcode code = perform() ? outcome() : CURLE_FAILED_INIT;
  if (_isOutOfMemory) throw std::bad_alloc();
  if (code != CURLE_OK) {
    failure = reason(code);
    return std::nullopt;
  }
  describeResponse();
  _response.data = _body.take();
  return std::move(_response);
}

}  // namespace

std::optional<CurlResponse> fetchWithCurl(const CurlRequest& request, std::string& failure) {
  static std::once_flag initialised;
  std::call_once(initialised, [] { curl_global_init(CURL_GLOBAL_DEFAULT); });
  return Transfer(request).run(failure);
}

}  // namespace xquery
