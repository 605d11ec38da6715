#include "StageCorePluginVideoInput/Composition.h"

#include "CoreVideoUtils/BurnInText.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "FileIO/ImageSequenceIO/ImageSequenceWriter.h"
#include "FileIO/MkvIO/MkvWriter.h"
#include "FileIO/MovIO/MovWriter.h"
#include "FileIO/RapidAVI/Writer.h"
#include "FileIO/TarvoVideo/Writer.h"
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDriver.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Driver.h"
#include "StageCoreRuntime/Shared.h"

#if defined( STAGECORE_OPENGL )
#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGL.h"
#endif

namespace Composition
{

#if defined( STAGECORE_OPENGL )
namespace
{

std::shared_ptr<KVZ::IPixelFormatConverter> MakeOpenGLConverter( CoreVideoUtilsOpenGL::EUse i_Use )
{
  return std::make_shared<CoreVideoUtilsOpenGL::VPixelFormatConverterOpenGL>(
    CoreVideoUtilsOpenGL::VPixelFormatConverterOpenGL::VSettings{ .m_Use = i_Use } );
}

}
#endif

std::vector<VideoInputHAL::VDriverMaker> DriverMakers()
{
  return { [] { return KVZ::MakeShared<VideoInputHAL::VBluefish444Driver>(); },
    [] { return KVZ::MakeShared<VideoInputHAL::VBlackmagicDeckLinkDriver>(); } };
}

std::shared_ptr<const KVZ::VVideoWriterFactory> WriterFactory()
{
  auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
  for( const auto Container : { KVZ::IVideoContainer::EMOV, KVZ::IVideoContainer::EMP4 } )
  {
    pFactory->Register( Container,
      []( KVZ::IVideoContainer::Enum i_Container, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
      { return std::make_shared<MovIO::VMovWriter>( i_Container, std::move( i_pEncoder ) ); } );
  }
  pFactory->Register( KVZ::IVideoContainer::EAVI,
    []( KVZ::IVideoContainer::Enum, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
    { return std::make_shared<RapidAVI::VRapidAVIWriter>( std::move( i_pEncoder ) ); } );
  pFactory->Register( KVZ::IVideoContainer::ETVID,
    []( KVZ::IVideoContainer::Enum, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
    { return std::make_shared<TarvoVideo::VWriter>( std::move( i_pEncoder ) ); } );
  pFactory->Register( KVZ::IVideoContainer::EMKV,
    []( KVZ::IVideoContainer::Enum, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
    { return std::make_shared<MkvIO::VMkvWriter>( std::move( i_pEncoder ) ); } );
  pFactory->Register( KVZ::IVideoContainer::EIMAGES,
    []( KVZ::IVideoContainer::Enum, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
    { return std::make_shared<ImageSequenceIO::VImageSequenceWriter>( std::move( i_pEncoder ) ); } );
  return pFactory;
}

std::vector<KVZ::IVideoContainer::Enum> WritableContainers()
{
  const auto pFactory = WriterFactory();
  std::vector<KVZ::IVideoContainer::Enum> Containers;
  for( int32_t Value = 0; Value < KVZ::VideoContainerCount; ++Value )
  {
    const auto Container = static_cast<KVZ::IVideoContainer::Enum>( Value );
    if( pFactory->IsRegistered( Container ) )
    {
      Containers.push_back( Container );
    }
  }
  return Containers;
}

VideoEncoding::VEncoderParts EncoderParts()
{
  VideoEncoding::VEncoderParts Parts;
  Parts.m_ConverterMakers[VideoEncoding::EConverter::Software] = [] { return std::make_shared<CoreVideoUtils::VPixelFormatConverter>(); };
#if defined( STAGECORE_OPENGL )
  Parts.m_ConverterMakers[VideoEncoding::EConverter::OpenGLFirst] = [] { return MakeOpenGLConverter( CoreVideoUtilsOpenGL::EUse::Always ); };
  Parts.m_ConverterMakers[VideoEncoding::EConverter::OpenGLSecond] = [] { return MakeOpenGLConverter( CoreVideoUtilsOpenGL::EUse::LensAlone ); };
#endif
  Parts.m_Compressors = VideoEncoding::ImageCompressors();
  Parts.m_DrawText = []( KVZ::IPixelFormatConverter& i_rConverter, const KVZ::VideoFrameInfo& i_rInfo, const VideoEncoding::VBurnInSettings& i_rText,
                       uint8_t* io_pPixels, size_t i_Size )
  { return CoreVideoUtils::BurnInText( i_rConverter, i_rInfo, i_rText.m_SizeIndex, i_rText.m_X, i_rText.m_Y, i_rText.m_Text, io_pPixels, i_Size ); };
  return Parts;
}

}
