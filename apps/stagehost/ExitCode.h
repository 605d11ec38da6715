// What the program's exit tells a script.
#pragma once

enum EExitCode : int
{
  ExitComplete = 0,   // all that was asked for is in the files
  ExitFailed = 1,
  ExitUsage = 2,
  ExitLostFrames = 3,
  ExitNoDevice = 4   // no device or no signal
};
