// INT and TERM: the first asks the running command to finish, the second ends the program at once with 130.
#pragma once

// Installs the handlers. Once, before other threads are made.
void InstallInterrupt();

bool IsInterrupted();

// How long a command that polls waits between two looks.
inline constexpr double PollSeconds = 0.02;

// Waits, at most so long, and returns earlier when the first signal comes. False when it came.
bool WaitUninterrupted( double i_Seconds );

// Waits so long although the first signal has come.
void WaitAfterInterrupt( double i_Seconds );
