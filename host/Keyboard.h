// Single keys of the terminal.
#pragma once

namespace host {

// One at a time. While it lives, keys come without Return and are not shown, if standard input is a terminal
// and this program in its foreground. The terminal's mode is restored at the end and by everything that ends
// or halts the program before: Ctrl-C, Ctrl-Z, Ctrl-\ and crashes.
class CKeyboard {
public:
    CKeyboard();
    ~CKeyboard();
    CKeyboard(const CKeyboard&) = delete;
    CKeyboard& operator=(const CKeyboard&) = delete;

    // Waits that long for a key; 0 when there was none.
    char wait(int milliseconds);
};

} // namespace host
