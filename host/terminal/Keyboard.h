// Reads single keys from the terminal.
#pragma once

namespace host {

// Keys that are not a character; greater than any character.
enum EKey { kKeyLeft = 256, kKeyRight, kKeyUp, kKeyDown, kKeyShiftLeft, kKeyShiftRight };

// Only one object at a time. During its lifetime keys are read without Return and not echoed, if standard
// input is a terminal and this program is in its foreground. The terminal's mode is restored by the
// destructor and before anything ends or suspends the program: Ctrl-C, Ctrl-Z, Ctrl-\ and crashes.
class CKeyboard {
public:
    CKeyboard();
    ~CKeyboard();
    CKeyboard(const CKeyboard&) = delete;
    CKeyboard& operator=(const CKeyboard&) = delete;

    // Waits up to that time for a key: a character or an EKey; 0 if none was pressed.
    int waitForKey(int milliseconds);
    // The same; 0 also for keys that are not a character.
    char wait(int milliseconds);

private:
    char readByte(int milliseconds);
};

} // namespace host
