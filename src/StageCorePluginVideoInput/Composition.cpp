#include "StageCorePluginVideoInput/Composition.h"

#include "FileIO/TarvoVideo/Writer.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDriver.h"
#include "StageCoreRuntime/Shared.h"

namespace Composition
{

std::vector<VideoInputHAL::VDriverMaker> DriverMakers()
{
  return { [] { return KVZ::MakeShared<VideoInputHAL::VBlackmagicDeckLinkDriver>(); } };
}

std::shared_ptr<const KVZ::VVideoWriterFactory> WriterFactory()
{
  auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
  pFactory->Register( KVZ::IVideoContainer::ETVID,
    []( KVZ::IVideoContainer::Enum, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
    { return std::make_shared<TarvoVideo::VWriter>( std::move( i_pEncoder ) ); } );
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

}
