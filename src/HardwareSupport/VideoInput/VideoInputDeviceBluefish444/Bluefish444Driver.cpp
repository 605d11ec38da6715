#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Driver.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Device.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Tables.h"
#include "NotificationSystem/AsioPostalService.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <optional>
#include <utility>
#include <vector>

namespace VideoInputHAL
{

namespace
{

namespace Property = BlueVelvet::Property;

// In the answer about the card's streams
constexpr uint32_t OutputsMask = 0x0F;
constexpr uint32_t InputsMask = 0xF0;
constexpr uint32_t InputsShift = 4;

std::optional<uint32_t> QueryFeatures( VBluefish444SDKWrapper& i_rCard, int i_Property )
{
  const std::optional<uint32_t> Features = i_rCard.Query( i_Property );
  if( !Features )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Querying card features property is not supported, a later driver is required." );
  }
  return Features;
}

// 0, with a line in the log, for a card that cannot be used.
uint32_t CountInputs( VBluefish444SDKWrapper& i_rCard )
{
  i_rCard.Query( Property::ProductId );   // part of making a card known; nothing depends on the answer
  const std::optional<uint32_t> Streams = QueryFeatures( i_rCard, Property::CardFeatureStreamInfo );
  if( !Streams )
  {
    return 0;
  }
  const uint32_t Inputs = ( *Streams & InputsMask ) >> InputsShift;
  if( Inputs == 0 )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "%1%",
      *Streams & OutputsMask ? "Card has output channels but no inputs. The outputs should be reconfigured as inputs."
                             : "Card does not have any input channels" );
    return 0;
  }
  const std::optional<uint32_t> Connectors = QueryFeatures( i_rCard, Property::CardFeatureConnectorInfo );
  if( Connectors && *Connectors == 0 )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Card has no connectors, cannot continue." );
  }
  return Connectors.value_or( 0 ) == 0 ? 0 : Inputs;
}

}

class VBluefish444Driver::VImpl
{
public:
  explicit VImpl( VFunctionsMaker i_Maker )
    : m_Maker( std::move( i_Maker ) ),
      m_pPostalService( std::make_shared<NotificationSystem::VAsioPostalService>( "VBluefish444Driver" ) ),
      m_DeviceArrived( m_pPostalService )
  {
  }
  ~VImpl();

  void StartDiscovery();

  const VFunctionsMaker m_Maker;
  const std::shared_ptr<NotificationSystem::VAsioPostalService> m_pPostalService;
  NotificationSystem::VMultiCallbackPostal<void( std::shared_ptr<IVideoInputDevice> )> m_DeviceArrived;

private:
  void FindInputs( const BlueVelvet::VFlatFunctions& i_rFunctions, int i_Card );
  void AddInput( VBluefish444Input i_Input );

  boost::mutex m_Mutex;
  bool m_bStarted GUARDED_BY( m_Mutex ) = false;
  std::vector<std::shared_ptr<VBluefish444Device>> m_Devices GUARDED_BY( m_Mutex );
};

VBluefish444Driver::VImpl::~VImpl()
{
  std::vector<std::shared_ptr<VBluefish444Device>> Devices;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Devices.swap( m_Devices );
  }
  for( const auto& pDevice : Devices )
  {
    pDevice->Close();
  }
}

void VBluefish444Driver::VImpl::StartDiscovery()
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( std::exchange( m_bStarted, true ) )
    {
      return;
    }
  }
  const BlueVelvet::VFlatFunctions* const pFunctions = m_Maker();
  const int Cards = pFunctions ? VBluefish444SDKWrapper( *pFunctions ).DeviceCount() : 0;
  if( Cards < 1 )
  {
    KVZ_LOG( Bluefish444LogCategory, 6, "No Bluefish card detected" );
    return;
  }
  for( int Card = 1; Card <= Cards; ++Card )
  {
    FindInputs( *pFunctions, Card );
  }
}

void VBluefish444Driver::VImpl::FindInputs( const BlueVelvet::VFlatFunctions& i_rFunctions, int i_Card )
{
  VBluefish444SDKWrapper Card( i_rFunctions );
  if( !Card.Attach( i_Card ) )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Error attaching to card %d.", i_Card );
    return;
  }
  const int CardType = Card.CardType();
  const uint32_t Inputs = CountInputs( Card );
  for( uint32_t Input = 0; Input < Inputs; ++Input )
  {
    const auto pInput = std::make_shared<VBluefish444SDKWrapper>( i_rFunctions );
    if( !pInput->AttachInput( i_Card, Input ) )
    {
      KVZ_LOG( Bluefish444LogCategory, 2, "Error attaching input %d to card %d.", Input, i_Card );
      continue;
    }
    AddInput( { pInput, CardType, i_Card, BlueVelvet::InputChannelA + Input, 0 } );
  }
}

void VBluefish444Driver::VImpl::AddInput( VBluefish444Input i_Input )
{
  std::shared_ptr<VBluefish444Device> pDevice;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    i_Input.m_DeviceIndex = static_cast<int32_t>( m_Devices.size() );
    pDevice = KVZ::MakeShared<VBluefish444Device>( i_Input, m_pPostalService );
    m_Devices.push_back( pDevice );
  }
  m_DeviceArrived( pDevice );
}

VBluefish444Driver::VBluefish444Driver( VFunctionsMaker i_Maker ) : m_pImpl( std::make_unique<VImpl>( std::move( i_Maker ) ) ) {}

VBluefish444Driver::~VBluefish444Driver() = default;

IVideoInputDriver::VDeviceCallback& VBluefish444Driver::GetDeviceArrivedCallback() { return m_pImpl->m_DeviceArrived; }

void VBluefish444Driver::StartDiscovery() { m_pImpl->StartDiscovery(); }

}
