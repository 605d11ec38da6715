#include "CoreVideoUtilsOpenGL/XDisplay.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <GL/glx.h>
#include <X11/Xlib.h>

#include <atomic>
#include <memory>

namespace CoreVideoUtilsOpenGL
{

namespace
{

int LogXError( Display*, XErrorEvent* i_pError )
{
  KVZ_LOG_DETAIL( "CoreVideoUtilsOpenGL", "The X server refused request %1% with error %2%", int{ i_pError->request_code },
    int{ i_pError->error_code } );
  return 0;
}

// What follows is up to the connection's own function: to end the process, or the one below.
int LogXEnd( Display* )
{
  KVZ_LOG_ERROR( "CoreVideoUtilsOpenGL", "The X server has ended" );
  return 0;
}

std::atomic<bool> s_bServerEnded{ false };

void NoteXEnd( Display*, void* ) { s_bServerEnded = true; }

}

struct VXDisplay::VConnection
{
  explicit VConnection( Display* i_pDisplay ) : m_pDisplay( i_pDisplay ) {}
  ~VConnection() { XCloseDisplay( m_pDisplay ); }
  VConnection( const VConnection& ) = delete;
  VConnection& operator=( const VConnection& ) = delete;

  static std::unique_ptr<VConnection> Open()
  {
    Display* const pDisplay = XOpenDisplay( nullptr );
    if( !pDisplay )
    {
      return nullptr;
    }
    XSetIOErrorExitHandler( pDisplay, &NoteXEnd, nullptr );
    return std::make_unique<VConnection>( pDisplay );
  }

  Display* const m_pDisplay;
};

VXDisplay::VXDisplay() : m_pConnection( VConnection::Open() ) {}

VXDisplay::~VXDisplay() = default;

std::string VXDisplay::WhyUnusable() const
{
  if( HasServerEnded() )
  {
    return "the X server has ended";
  }
  if( !m_pConnection )
  {
    return "there is no X display";
  }
  Display* const pDisplay = m_pConnection->m_pDisplay;
  int ErrorBase = 0;
  int EventBase = 0;
  int Count = 0;
  if( !glXQueryExtension( pDisplay, &ErrorBase, &EventBase ) )
  {
    return "the X display has no OpenGL";
  }
  const std::unique_ptr<GLXFBConfig, int ( * )( void* )> pFormats( glXGetFBConfigs( pDisplay, DefaultScreen( pDisplay ), &Count ), &XFree );
  return pFormats && Count > 0 ? "" : "the X display has no format of pixels for OpenGL";
}

void VXDisplay::OutliveServer()
{
  if( Display* const pDisplay = glXGetCurrentDisplay() )
  {
    XSetIOErrorExitHandler( pDisplay, &NoteXEnd, nullptr );
  }
}

bool VXDisplay::HasServerEnded() { return s_bServerEnded; }

VXErrorsLogged::VXErrorsLogged()
  : m_pFormer( reinterpret_cast<void ( * )()>( XSetErrorHandler( &LogXError ) ) ),
    m_pFormerEnd( reinterpret_cast<void ( * )()>( XSetIOErrorHandler( &LogXEnd ) ) )
{
  s_bServerEnded = false;
}

VXErrorsLogged::~VXErrorsLogged()
{
  XSetErrorHandler( reinterpret_cast<XErrorHandler>( m_pFormer ) );
  XSetIOErrorHandler( reinterpret_cast<XIOErrorHandler>( m_pFormerEnd ) );
}

}
