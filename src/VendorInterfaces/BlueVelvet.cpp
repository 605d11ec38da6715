#include "VendorInterfaces/BlueVelvet.h"

namespace BlueVelvet
{

namespace
{

struct VVideoInfo
{
  uint32_t m_Width = 0;
  uint32_t m_Height = 0;
  uint32_t m_LineBytes = 0;
  uint32_t m_FrameBytes = 0;
  uint32_t m_GoldenBytes = 0;
};

// Zeros where the library does not know the mode. An older library tells no frame bytes.
VVideoInfo GetVideoInfo( const VFlatFunctions& i_r, uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod )
{
  if( !i_r.bfcGetVideoInfo )
  {
    return { i_r.bfcGetPixelsPerLine( i_Mode ), i_r.bfcGetLinesPerFrame( i_Mode, i_UpdateMethod ), i_r.bfcGetBytesPerLine( i_Mode, i_MemoryFormat ),
      0, i_r.bfcGetGoldenValue( i_Mode, i_MemoryFormat, i_UpdateMethod ) };
  }
  VVideoInfo Info;
  const BErr Result = i_r.bfcGetVideoInfo( static_cast<int>( i_Mode ), static_cast<int>( i_UpdateMethod ), static_cast<int>( i_MemoryFormat ),
    &Info.m_Width, &Info.m_Height, &Info.m_LineBytes, &Info.m_FrameBytes, &Info.m_GoldenBytes );
  return Result == 0 ? Info : VVideoInfo();
}

}

bool VFlatFunctions::IsComplete() const
{
  const bool bCard = bfcFactory && bfcDestroy && bfcEnumerate && bfcAttach && bfcDetach && bfcQueryCardType && bfcQueryCardProperty32 &&
    bfcSetCardProperty32 && bfcVideoCaptureStop;
  const bool bFrames = bfcWaitVideoInputSync && bfcRenderBufferCapture && bfcSystemBufferRead && bfcDecodeHancFrameEx;
  const bool bOlderSizes = bfcGetPixelsPerLine && bfcGetLinesPerFrame && bfcGetBytesPerLine && bfcGetGoldenValue;
  return bCard && bFrames && ( bfcGetVideoInfo || bOlderSizes );
}

BErr CBlueVelvet4::device_enumerate( int& o_rCount ) { return m_rFunctions.bfcEnumerate( m_Handle, &o_rCount ); }

BErr CBlueVelvet4::device_attach( int i_Device ) { return m_rFunctions.bfcAttach( m_Handle, i_Device ); }

BErr CBlueVelvet4::device_detach() { return m_rFunctions.bfcDetach( m_Handle ); }

BErr CBlueVelvet4::has_video_cardtype( int& o_rType ) { return m_rFunctions.bfcQueryCardType( m_Handle, &o_rType, 0 ); }

BErr CBlueVelvet4::QueryCardProperty( int i_Property, uint32_t& o_rValue )
{
  return m_rFunctions.bfcQueryCardProperty32( m_Handle, i_Property, &o_rValue );
}

BErr CBlueVelvet4::SetCardProperty( int i_Property, uint32_t i_Value ) { return m_rFunctions.bfcSetCardProperty32( m_Handle, i_Property, i_Value ); }

BErr CBlueVelvet4::video_capture_stop() { return m_rFunctions.bfcVideoCaptureStop( m_Handle ); }

BErr CBlueVelvet4::wait_input_video_synch( uint32_t i_UpdateMethod, uint64_t& o_rFieldCount )
{
  unsigned long Count = 0;
  const BErr Result = m_rFunctions.bfcWaitVideoInputSync( m_Handle, i_UpdateMethod, &Count );
  o_rFieldCount = Count;
  return Result;
}

BErr CBlueVelvet4::render_buffer_capture( uint32_t i_BufferId ) { return m_rFunctions.bfcRenderBufferCapture( m_Handle, i_BufferId ); }

BErr CBlueVelvet4::system_buffer_read( uint8_t* o_pTarget, uint64_t i_Size, uint32_t i_BufferId )
{
  return m_rFunctions.bfcSystemBufferRead( m_Handle, o_pTarget, i_Size, i_BufferId, 0 );
}

CBlueVelvet4* BlueVelvetFactory4( const VFlatFunctions& i_rFunctions )
{
  const VHandle Handle = i_rFunctions.bfcFactory();
  return Handle ? new CBlueVelvet4( i_rFunctions, Handle ) : nullptr;
}

void BlueVelvetDestroy( CBlueVelvet4* i_pCard )
{
  if( i_pCard )
  {
    i_pCard->Functions().bfcDestroy( i_pCard->Handle() );
    delete i_pCard;
  }
}

uint32_t BlueVelvetGolden( const VFlatFunctions& i_rFunctions, uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod )
{
  return GetVideoInfo( i_rFunctions, i_Mode, i_MemoryFormat, i_UpdateMethod ).m_GoldenBytes;
}

// What does not depend on format or method is asked for with any.
uint32_t BlueVelvetLinePixels( const VFlatFunctions& i_rFunctions, uint32_t i_Mode )
{
  return GetVideoInfo( i_rFunctions, i_Mode, MemoryFormat::TwoVUY, UpdateMethod::Frame ).m_Width;
}

uint32_t BlueVelvetLineBytes( const VFlatFunctions& i_rFunctions, uint32_t i_Mode, uint32_t i_MemoryFormat )
{
  return GetVideoInfo( i_rFunctions, i_Mode, i_MemoryFormat, UpdateMethod::Frame ).m_LineBytes;
}

uint32_t BlueVelvetFrameLines( const VFlatFunctions& i_rFunctions, uint32_t i_Mode, uint32_t i_UpdateMethod )
{
  return GetVideoInfo( i_rFunctions, i_Mode, MemoryFormat::TwoVUY, i_UpdateMethod ).m_Height;
}

bool hanc_decoder_ex( CBlueVelvet4& i_rCard, uint32_t i_CardType, uint32_t* i_pHanc, VHancDecodeRecord& io_rRecord )
{
  return i_rCard.Functions().bfcDecodeHancFrameEx( i_rCard.Handle(), i_CardType, i_pHanc, &io_rRecord ) == 0;
}

}
