// What the X display that DISPLAY names has to do with OpenGL. Apart, because the headers of X define common words.
#pragma once

#include <memory>
#include <string>

namespace CoreVideoUtilsOpenGL
{

// A connection to it. Servers that are started for one program begin anew when the last connection ends, so this one stays while others are made
// and ended. One thread.
class VXDisplay
{
public:
  VXDisplay();
  ~VXDisplay();
  VXDisplay( const VXDisplay& ) = delete;
  VXDisplay& operator=( const VXDisplay& ) = delete;

  // Why it cannot be drawn on with OpenGL; empty where it can.
  std::string WhyUnusable() const;

  // Connections end the process when their server ends. From here on, that of the current context does not: it is good for nothing then.
  static void OutliveServer();
  // Whether a server that was to be outlived has ended. No new connection is made to another one while VXErrorsLogged lives.
  static bool HasServerEnded();

private:
  struct VConnection;
  const std::unique_ptr<VConnection> m_pConnection;   // empty where there is no display
};

// While it lives, errors that the X server reports and its end go to the log. Else errors end the process. Whoever else in the process speaks to an X
// server is meant too, so this is for processes that have no windows of their own.
class VXErrorsLogged
{
public:
  VXErrorsLogged();
  ~VXErrorsLogged();
  VXErrorsLogged( const VXErrorsLogged& ) = delete;
  VXErrorsLogged& operator=( const VXErrorsLogged& ) = delete;

private:
  void ( *const m_pFormer )();
  void ( *const m_pFormerEnd )();
};

}
