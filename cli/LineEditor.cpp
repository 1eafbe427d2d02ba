#include "LineEditor.h"

#include "Messages.h"
#include "Streams.h"
#include "TerminalSignals.h"
#include "Width.h"

#include <algorithm>
#include <cerrno>
#include <clocale>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <histedit.h>
#include <langinfo.h>
#include <poll.h>
#include <string_view>
#include <unistd.h>
#include <utility>

namespace cli {
namespace {

constexpr wchar_t replacement = 0xFFFD;

// --- text ----------------------------------------------------------------------------------------

void appendUTF8(wchar_t character, std::string& text) {
  const auto code = static_cast<unsigned>(character);
  const auto add = [&text](unsigned byte) { text += static_cast<char>(byte); };
  if (code < 0x80) {
    add(code);
  } else if (code < 0x800) {
    add(0xC0 | code >> 6);
  } else if (code < 0x10000) {
    add(0xE0 | code >> 12);
    add(0x80 | (code >> 6 & 0x3F));
  } else {
    add(0xF0 | code >> 18);
    add(0x80 | (code >> 12 & 0x3F));
    add(0x80 | (code >> 6 & 0x3F));
  }
  if (code >= 0x80) add(0x80 | (code & 0x3F));
}

std::string narrow(std::wstring_view text) {
  std::string result;
  for (const wchar_t character : text) appendUTF8(character, result);
  return result;
}

// How many bytes follow the first one of a character; none for what begins no character.
size_t bytesBehind(unsigned char first) {
  if (first >= 0xC2 && first < 0xE0) return 1;
  if (first >= 0xE0 && first < 0xF0) return 2;
  return first >= 0xF0 && first < 0xF5 ? 3 : 0;
}

bool continuesCharacter(unsigned char byte) {
  return (byte & 0xC0) == 0x80;
}

// Reads one character of bytes that `next` gives, which answers -1, and takes nothing, where none
// follows that continues a character.
template <class Next>
wchar_t decode(unsigned char first, const Next& next) {
  if (first < 0x80) return first;
  const size_t count = bytesBehind(first);
  if (count == 0) return replacement;
  unsigned code = first & (0x3FU >> count);
  for (size_t n = 0; n < count; ++n) {
    const int byte = next();
    if (byte < 0) return replacement;
    code = code << 6 | (static_cast<unsigned>(byte) & 0x3F);
  }
  return code > 0x10FFFF || (code >= 0xD800 && code < 0xE000) ? replacement
                                                              : static_cast<wchar_t>(code);
}

std::wstring widen(std::string_view text) {
  std::wstring result;
  for (size_t at = 0; at < text.size();) {
    const auto first = static_cast<unsigned char>(text[at++]);
    result += decode(first, [&]() -> int {
      const bool goesOn =
          at < text.size() && continuesCharacter(static_cast<unsigned char>(text[at]));
      return goesOn ? static_cast<unsigned char>(text[at++]) : -1;
    });
  }
  return result;
}

// What libedit writes is encoded as the locale says.
void useUTF8() {
  setlocale(LC_CTYPE, "");
  if (std::string_view(nl_langinfo(CODESET)) != "UTF-8") setlocale(LC_CTYPE, "C.UTF-8");
}

bool canMoveCursor() {
  const char* const terminal = std::getenv("TERM");
  return terminal && *terminal && std::string_view(terminal) != "dumb";
}

// --- lists of completions ------------------------------------------------------------------------

std::string commonStart(const std::vector<std::string>& words) {
  std::string start = words.front();
  for (const std::string& word : words) {
    const auto end = std::mismatch(start.begin(), start.end(), word.begin(), word.end()).first;
    start.erase(end, start.end());
  }
  // Not within a character.
  while (!start.empty() && start.size() < words.front().size() &&
         (static_cast<unsigned char>(words.front()[start.size()]) & 0xC0) == 0x80) {
    start.pop_back();
  }
  return start;
}

// In columns where the terminal is wide enough, on a line of their own after the one being edited.
std::string listed(const std::vector<std::string>& words) {
  constexpr size_t mostListed = 100;
  const size_t count = std::min(words.size(), mostListed);
  size_t width = 0;
  for (size_t n = 0; n < count; ++n) width = std::max(width, words[n].size() + 2);
  const size_t columns = std::max<size_t>(1, (columnsOfTerminal(STDOUT_FILENO) - 1) / width);
  std::string text = "\n";
  for (size_t n = 0; n < count; ++n) {
    const bool isLast = n % columns == columns - 1 || n + 1 == count;
    const std::string word = visibleName(words[n]);
    text += word + (isLast ? "\n" : std::string(width - std::min(width, word.size()), ' '));
  }
  if (words.size() > count) {
    text += "and " + std::to_string(words.size() - count) + " more\n";
  }
  return text;
}

}  // namespace

// --- the editor ----------------------------------------------------------------------------------

class LineEditor::Implementation {
 public:
  explicit Implementation(Completer complete) : _complete(std::move(complete)) {
    restoreTerminalAtEnd();
    if (!canMoveCursor()) return;
    useUTF8();
    // What libedit has to say, as of a terminal that it does not know, is of no use to anybody.
    _complaints = std::fopen("/dev/null", "we");
    _editor = el_init("xquery", stdin, stdout, _complaints);
    if (_editor) configure();
  }
  ~Implementation() {
    if (_editor) el_end(_editor);
    if (_history) history_wend(_history);
    if (_complaints) std::fclose(_complaints);
  }
  Implementation(const Implementation&) = delete;
  Implementation& operator=(const Implementation&) = delete;

  Event read(const std::string& prompt, std::string& line) {
    const TerminalSignals signals;
    _signals = &signals;
    _event = Event::End;
    const Event event = _editor ? readEdited(prompt, line) : readPlain(prompt, line);
    _signals = nullptr;
    return event;
  }

  void remember(const std::string& entry) {
    if (!_history) return;
    HistEventW ignored;
    history_w(_history, &ignored, H_ENTER, widen(entry).c_str());
  }

 private:
  static Implementation& of(EditLine* editor) {
    void* self = nullptr;
    el_wget(editor, EL_CLIENTDATA, &self);
    return *static_cast<Implementation*>(self);
  }
  static wchar_t* givePrompt(EditLine* editor) { return of(editor)._prompt.data(); }
  static int giveCharacter(EditLine* editor, wchar_t* character) {
    return of(editor).nextCharacter(*character);
  }
  static unsigned char completeWord(EditLine* editor, int) { return of(editor).completeHere(); }

  void configure() {
    constexpr int mostRemembered = 1000;
    HistEventW ignored;
    _history = history_winit();
    if (_history) history_w(_history, &ignored, H_SETSIZE, mostRemembered);
    el_wset(_editor, EL_CLIENTDATA, this);
    el_wset(_editor, EL_PROMPT, givePrompt);
    el_wset(_editor, EL_EDITOR, L"emacs");
    el_wset(_editor, EL_SIGNAL, 0);
    el_wset(_editor, EL_GETCFN, giveCharacter);
    if (_history) el_wset(_editor, EL_HIST, history_w, _history);
    el_wset(_editor, EL_ADDFN, L"complete-name", L"Complete the name before the cursor",
            completeWord);
    el_wset(_editor, EL_BIND, L"^I", L"complete-name", nullptr);
    el_wset(_editor, EL_BIND, L"^R", L"em-inc-search-prev", nullptr);
    el_source(_editor, nullptr);  // the user's own settings
  }

  Event readEdited(const std::string& prompt, std::string& line) {
    _prompt = widen(prompt);
    int count = 0;
    // Before the prompt, so that nothing that is typed then is shown by the terminal as well.
    el_wset(_editor, EL_PREP_TERM, 1);
    const wchar_t* const text = el_wgets(_editor, &count);
    if (!text || count <= 0) {
      el_reset(_editor);
      return _event;
    }
    std::wstring_view whole(text, static_cast<size_t>(count));
    if (whole.ends_with(L'\n')) whole.remove_suffix(1);
    line = narrow(whole);
    return Event::Line;
  }

  Event readPlain(const std::string& prompt, std::string& line) {
    if (!writeAll(STDOUT_FILENO, prompt)) return Event::End;
    line.clear();
    for (;;) {
      const int byte = nextByte();
      if (byte == '\n') return Event::Line;
      if (byte >= 0) line += static_cast<char>(byte);
      if (byte < 0 && (_event == Event::Interrupt || line.empty())) return _event;
      if (byte < 0) return Event::Line;
    }
  }

  // -1 when there is none, for the reason that is the event then.
  int nextByte() {
    if (_notTaken >= 0) return std::exchange(_notTaken, -1);
    for (;;) {
      pollfd ready[] = {{STDIN_FILENO, POLLIN, 0}, {_signals->descriptor(), POLLIN, 0}};
      if (poll(ready, 2, -1) < 0 && errno != EINTR) return -1;
      while (const int signal = _signals->next()) {
        if (signal == SIGINT) {
          _event = Event::Interrupt;
          return -1;
        }
        heed(signal);
      }
      if (ready[0].revents == 0) continue;
      unsigned char byte = 0;
      const ssize_t count = ::read(STDIN_FILENO, &byte, 1);
      if (count == 1) return byte;
      if (count == 0 || (errno != EINTR && errno != EAGAIN)) return -1;
    }
  }

  int nextCharacter(wchar_t& character) {
    const int first = nextByte();
    if (first < 0) return _event == Event::Interrupt ? -1 : 0;
    character = decode(static_cast<unsigned char>(first), [this] {
      const int byte = nextByte();
      if (byte >= 0 && continuesCharacter(static_cast<unsigned char>(byte))) return byte;
      _notTaken = byte;
      return -1;
    });
    return 1;
  }

  void heed(int signal) {
    if (signal == SIGTSTP) {
      if (_editor) el_wset(_editor, EL_PREP_TERM, 0);
      raise(SIGSTOP);
    }
    if (!_editor) return;
    if (signal == SIGWINCH) {
      el_resize(_editor);
    } else {
      el_wset(_editor, EL_PREP_TERM, 1);
    }
    el_wset(_editor, EL_REFRESH);
  }

  unsigned char completeHere() {
    const LineInfoW* const info = el_wline(_editor);
    const std::wstring_view before(info->buffer, static_cast<size_t>(info->cursor - info->buffer));
    if (before.empty() || before.back() == L' ' || before.back() == L'\t') {
      return insert(before.empty() || before.front() != L':' ? L"  " : L"");
    }
    const std::string text = narrow(before);
    const Completions found = _complete(text);
    if (found.words.empty()) return CC_REFRESH_BEEP;
    const std::string start = commonStart(found.words);
    const size_t present = text.size() - found.start;
    if (start.size() > present) return insert(widen(start.substr(present)));
    if (found.words.size() == 1) return CC_NORM;
    if (!writeAll(STDOUT_FILENO, listed(found.words))) return CC_ERROR;
    return CC_REDISPLAY;
  }

  unsigned char insert(const std::wstring& text) {
    return el_winsertstr(_editor, text.c_str()) == 0 ? CC_REFRESH : CC_REFRESH_BEEP;
  }

  const Completer _complete;
  std::FILE* _complaints = nullptr;
  EditLine* _editor = nullptr;
  HistoryW* _history = nullptr;
  const TerminalSignals* _signals = nullptr;
  std::wstring _prompt;
  Event _event = Event::End;
  int _notTaken = -1;  // a byte that was read, and is the next one all the same
};

LineEditor::LineEditor(Completer complete)
    : _implementation(std::make_unique<Implementation>(std::move(complete))) {}

LineEditor::~LineEditor() = default;

LineEditor::Event LineEditor::read(const std::string& prompt, std::string& line) {
  return _implementation->read(prompt, line);
}

void LineEditor::remember(const std::string& entry) {
  _implementation->remember(entry);
}

}  // namespace cli
