// Qt's application object, without which it makes no OpenGL context.
#pragma once

#include "CoreVideoUtilsOpenGL/XDisplay.h"

#include <memory>
#include <string>

namespace CoreVideoUtilsOpenGL
{

// One of our own where the process has none. Its platform is "offscreen", which opens no window and needs no window manager but an X display, or,
// without one, "eglfs" led to EGL's platform without displays. Made and destroyed on the thread that makes contexts. While it is there, Qt's messages
// go to the log, and what the X server refuses ends no program.
class VGraphicsApplication
{
public:
  VGraphicsApplication();
  ~VGraphicsApplication();
  VGraphicsApplication( const VGraphicsApplication& ) = delete;
  VGraphicsApplication& operator=( const VGraphicsApplication& ) = delete;

private:
  class VOwn;
  const std::unique_ptr<VOwn> m_pOwn;   // empty where the process has one
};

// Whether it is worth asking Qt for a context: where there is no OpenGL at all, it may end the process.
class VGraphicsCheck
{
public:
  VGraphicsCheck();

  // Why there can be no context; empty where nothing is known to stand against it.
  const std::string& WhyUnusable() const { return m_WhyUnusable; }

  // With a context current: the end of its display ends the process no more.
  void OutliveDisplay() const;
  bool HasDisplayEnded() const;

private:
  const std::unique_ptr<VXDisplay> m_pDisplay;   // kept open beside Qt's own; empty where Qt needs none
  const std::string m_WhyUnusable;
};

}
