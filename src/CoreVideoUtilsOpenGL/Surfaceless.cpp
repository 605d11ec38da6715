#include "CoreVideoUtilsOpenGL/Surfaceless.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <QtCore/QFile>
#include <QtCore/QLibraryInfo>

#include <EGL/egl.h>

#include <unistd.h>

#include <array>
#include <atomic>
#include <cstring>
#include <vector>

namespace CoreVideoUtilsOpenGL
{

namespace
{

// No device of a display, an input or a terminal, and a screen whose size need not be asked for.
constexpr std::array Variables = { "QT_QPA_EGLFS_INTEGRATION=none", "QT_QPA_EGLFS_FB=/dev/null", "QT_QPA_EGLFS_WIDTH=640", "QT_QPA_EGLFS_HEIGHT=480",
  "QT_QPA_EGLFS_PHYSICAL_WIDTH=160", "QT_QPA_EGLFS_PHYSICAL_HEIGHT=120", "QT_QPA_EGLFS_DISABLE_INPUT=1", "QT_QPA_EGLFS_HIDECURSOR=1",
  "QT_QPA_NO_SIGNAL_HANDLER=1", "QT_QPA_ENABLE_TERMINAL_KEYBOARD=1" };
constexpr char Platform[] = "EGL_PLATFORM=surfaceless";

// Of two values the first one counts. Environments are kept until the process ends: one that is out of use may still be read.
char** MakeEnvironment()
{
  static std::vector<std::vector<char*>> s_Environments;
  std::vector<char*>& rNew = s_Environments.emplace_back();
  for( const char* pVariable : Variables )
  {
    rNew.push_back( const_cast<char*>( pVariable ) );
  }
  for( char** pVariable = environ; pVariable && *pVariable; ++pVariable )
  {
    rNew.push_back( *pVariable );
  }
  rNew.push_back( const_cast<char*>( Platform ) );
  rNew.push_back( nullptr );
  return rNew.data();
}

bool HasExtension( EGLDisplay i_pDisplay, const char* i_pName )
{
  const char* const pExtensions = eglQueryString( i_pDisplay, EGL_EXTENSIONS );
  return pExtensions && std::strstr( pExtensions, i_pName );
}

bool MakesContext( EGLDisplay i_pDisplay )
{
  if( !HasExtension( i_pDisplay, "EGL_KHR_surfaceless_context" ) || !eglBindAPI( EGL_OPENGL_ES_API ) )
  {
    return false;
  }
  constexpr std::array<EGLint, 3> Attributes = { EGL_CONTEXT_CLIENT_VERSION, 2, EGL_NONE };
  const EGLContext pContext = eglCreateContext( i_pDisplay, nullptr, EGL_NO_CONTEXT, Attributes.data() );
  const bool bCurrent = pContext != EGL_NO_CONTEXT && eglMakeCurrent( i_pDisplay, EGL_NO_SURFACE, EGL_NO_SURFACE, pContext );
  if( pContext != EGL_NO_CONTEXT )
  {
    eglMakeCurrent( i_pDisplay, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT );
    eglDestroyContext( i_pDisplay, pContext );
  }
  return bCurrent;
}

}

VSurfacelessEnvironment::VSurfacelessEnvironment() : m_pOwn( MakeEnvironment() ), m_pFormer( std::atomic_ref( environ ).exchange( m_pOwn ) ) {}

// Whoever has set a variable meanwhile has made another environment, which stays.
VSurfacelessEnvironment::~VSurfacelessEnvironment()
{
  char** pExpected = m_pOwn;
  std::atomic_ref( environ ).compare_exchange_strong( pExpected, m_pFormer );
}

// Qt's own display is the same, and it is Qt that ends it.
bool VSurfacelessEnvironment::HasContext()
{
  const QString Plugin = QLibraryInfo::location( QLibraryInfo::PluginsPath ) + "/platforms/libqeglfs.so";
  const EGLDisplay pDisplay = QFile::exists( Plugin ) ? eglGetDisplay( EGL_DEFAULT_DISPLAY ) : EGL_NO_DISPLAY;
  const bool bUsable = pDisplay != EGL_NO_DISPLAY && eglInitialize( pDisplay, nullptr, nullptr ) && MakesContext( pDisplay );
  KVZ_LOG_DETAIL( "CoreVideoUtilsOpenGL", "EGL %1% without a display", bUsable ? "draws" : "does not draw" );
  return bUsable;
}

}
