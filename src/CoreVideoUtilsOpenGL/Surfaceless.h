// OpenGL ES without any display, by EGL's platform "surfaceless", which Qt knows nothing of: its platform "eglfs" takes the display that EGL gives
// it, and can be led to do without a screen.
#pragma once

namespace CoreVideoUtilsOpenGL
{

// What eglfs needs to find in the environment while it begins. The process has its former environment back when this ends: so neither the
// programs that it starts nor a host's own use of EGL see any of it. A value of EGL_PLATFORM that is there already stays.
//
// The environment is exchanged as a whole, because other threads may read it meanwhile, and setenv moves what they read. One at a time.
class VSurfacelessEnvironment
{
public:
  VSurfacelessEnvironment();
  ~VSurfacelessEnvironment();
  VSurfacelessEnvironment( const VSurfacelessEnvironment& ) = delete;
  VSurfacelessEnvironment& operator=( const VSurfacelessEnvironment& ) = delete;

  // Whether EGL has a context in this environment. Where it has none, eglfs would end the process. Takes the context that is current away.
  static bool HasContext();

private:
  char** const m_pOwn;
  char** const m_pFormer;
};

}
