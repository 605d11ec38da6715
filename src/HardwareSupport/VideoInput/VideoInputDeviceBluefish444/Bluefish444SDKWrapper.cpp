#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444SDKWrapper.h"

namespace VideoInputHAL
{

using namespace BlueVelvet;

namespace
{

constexpr int UnknownCardType = -1;

}

VBluefish444SDKWrapper::VBluefish444SDKWrapper( const VFlatFunctions& i_rFunctions )
  : m_rFunctions( i_rFunctions ), m_pCard( BlueVelvetFactory4( i_rFunctions ) )
{
}

VBluefish444SDKWrapper::~VBluefish444SDKWrapper()
{
  if( m_pCard )
  {
    m_pCard->device_detach();
  }
  BlueVelvetDestroy( m_pCard );
}

int VBluefish444SDKWrapper::DeviceCount()
{
  int Count = 0;
  return m_pCard && m_pCard->device_enumerate( Count ) == 0 ? Count : 0;
}

bool VBluefish444SDKWrapper::Attach( int i_Card ) { return m_pCard && m_pCard->device_attach( i_Card ) == 0; }

bool VBluefish444SDKWrapper::AttachInput( int i_Card, uint32_t i_Input )
{
  return Attach( i_Card ) && Set( Property::DefaultVideoInputChannel, InputChannelA + i_Input );
}

int VBluefish444SDKWrapper::CardType()
{
  int Type = 0;
  return m_pCard && m_pCard->has_video_cardtype( Type ) == 0 ? Type : UnknownCardType;
}

std::optional<uint32_t> VBluefish444SDKWrapper::Query( int i_Property )
{
  uint32_t Value = 0;
  return m_pCard && m_pCard->QueryCardProperty( i_Property, Value ) == 0 ? std::optional( Value ) : std::nullopt;
}

bool VBluefish444SDKWrapper::Set( int i_Property, uint32_t i_Value ) { return m_pCard && m_pCard->SetCardProperty( i_Property, i_Value ) == 0; }

void VBluefish444SDKWrapper::StopVideoCapture()
{
  if( m_pCard )
  {
    m_pCard->video_capture_stop();
  }
}

std::optional<uint64_t> VBluefish444SDKWrapper::WaitForInputSync()
{
  uint64_t Count = 0;
  return m_pCard && m_pCard->wait_input_video_synch( UpdateMethod::Frame, Count ) == 0 ? std::optional( Count ) : std::nullopt;
}

void VBluefish444SDKWrapper::CaptureInto( uint32_t i_BufferId )
{
  if( m_pCard )
  {
    m_pCard->render_buffer_capture( i_BufferId );
  }
}

bool VBluefish444SDKWrapper::ReadBuffer( uint8_t* o_pTarget, uint64_t i_Size, uint32_t i_BufferId )
{
  return m_pCard && m_pCard->system_buffer_read( o_pTarget, i_Size, i_BufferId ) == 0;
}

bool VBluefish444SDKWrapper::DecodeHanc( int i_CardType, uint8_t* i_pHanc, VHancDecodeRecord& io_rRecord )
{
  return m_pCard && hanc_decoder_ex( *m_pCard, static_cast<uint32_t>( i_CardType ), reinterpret_cast<uint32_t*>( i_pHanc ), io_rRecord );
}

}
