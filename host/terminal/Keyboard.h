// Reads single keys from the terminal.
#pragma once

namespace host {

// Only one object at a time. During its lifetime keys are read without Return and not echoed, if standard
// input is a terminal and this program is in its foreground. The terminal's mode is restored by the
// destructor and before anything ends or suspends the program: Ctrl-C, Ctrl-Z, Ctrl-\ and crashes.
class CKeyboard {
public:
    CKeyboard();
    ~CKeyboard();
    CKeyboard(const CKeyboard&) = delete;
    CKeyboard& operator=(const CKeyboard&) = delete;

    // Waits up to that time for a key; 0 if none was pressed.
    char wait(int milliseconds);
};

} // namespace host
