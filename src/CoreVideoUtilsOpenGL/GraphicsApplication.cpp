#include "CoreVideoUtilsOpenGL/GraphicsApplication.h"

#include "CoreVideoUtilsOpenGL/Surfaceless.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <QtGui/QGuiApplication>

#include <array>

namespace CoreVideoUtilsOpenGL
{

namespace
{

// What Qt has to say is for those who look closely: whether OpenGL can be used is found out and said elsewhere.
void LogQtMessage( QtMsgType, const QMessageLogContext&, const QString& i_rText )
{
  KVZ_LOG_DETAIL( "CoreVideoUtilsOpenGL", "Qt: %1%", i_rText.toStdString() );
}

bool HasGraphics() { return qobject_cast<QGuiApplication*>( QCoreApplication::instance() ) != nullptr; }

bool IsOffscreen() { return HasGraphics() && QGuiApplication::platformName() == "offscreen"; }

}

class VGraphicsApplication::VOwn
{
public:
  VOwn() : m_pFormerHandler( qInstallMessageHandler( &LogQtMessage ) )
  {
    if( !m_Display.WhyUnusable().empty() )
    {
      const VSurfacelessEnvironment Environment;
      if( VSurfacelessEnvironment::HasContext() )
      {
        Begin( "eglfs" );
        return;
      }
    }
    Begin( "offscreen" );
  }
  ~VOwn()
  {
    m_pApplication.reset();
    qInstallMessageHandler( m_pFormerHandler );
  }

private:
  void Begin( const char* i_pPlatform )
  {
    m_Platform = i_pPlatform;
    m_Arguments[2] = m_Platform.data();
    m_pApplication = std::make_unique<QGuiApplication>( m_Count, m_Arguments.data() );
  }

  const VXErrorsLogged m_XErrorsLogged;
  const QtMessageHandler m_pFormerHandler;
  const VXDisplay m_Display;
  // Qt keeps references to its arguments.
  std::string m_Name = "StageCorePluginVideoInput";
  std::string m_Option = "-platform";
  std::string m_Platform;
  std::array<char*, 4> m_Arguments = { m_Name.data(), m_Option.data(), nullptr, nullptr };
  int m_Count = 3;
  std::unique_ptr<QGuiApplication> m_pApplication;
};

VGraphicsApplication::VGraphicsApplication() : m_pOwn( QCoreApplication::instance() ? nullptr : std::make_unique<VOwn>() ) {}

VGraphicsApplication::~VGraphicsApplication() = default;

// An application of another platform has a display that is known to be there, or none of X.
VGraphicsCheck::VGraphicsCheck()
  : m_pDisplay( IsOffscreen() ? std::make_unique<VXDisplay>() : nullptr ),
    m_WhyUnusable( m_pDisplay ? m_pDisplay->WhyUnusable()
        : HasGraphics()       ? ""
                              : "the process has an application object without graphics" )
{
}

void VGraphicsCheck::OutliveDisplay() const
{
  if( m_pDisplay )
  {
    VXDisplay::OutliveServer();
  }
}

bool VGraphicsCheck::HasDisplayEnded() const { return m_pDisplay && VXDisplay::HasServerEnded(); }

}
