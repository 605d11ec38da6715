// The names that this library shares with the vendor's, and the one of its own.
#include "VendorInterfaces/BlueVelvet.h"
#include "cards/bluefish444/BluefishTable.h"
#include "cards/bluefish444/HancStream.h"
#include "cards/bluefish444/VideoModes.h"

using namespace BlueVelvet;
using namespace VirtualCards;

namespace
{

constexpr BErr Success = 0;
constexpr BErr Failure = 1;

constexpr int SuperNova = 33;   // the card type

BErr ToResult( bool i_bDone ) { return i_bDone ? Success : Failure; }

// Empty while not attached, and while the card is out of the machine.
std::optional<VCardObject> FindAttached( VHandle i_Handle )
{
  std::optional<VCardObject> Object = VBluefishTable::Instance().Find( i_Handle );
  return Object && Object->m_pCard && Object->m_pCard->IsPresent() ? Object : std::nullopt;
}

// i_Call takes the input that a handle stands for.
template<class TCall>
BErr WithInput( VHandle i_Handle, TCall i_Call )
{
  const std::optional<VCardObject> Object = FindAttached( i_Handle );
  return ToResult( Object && Object->Input() && i_Call( *Object->Input() ) );
}

}

extern "C"
{

  VHandle bfcFactory() { return VBluefishTable::Instance().MakeObject(); }

  void bfcDestroy( VHandle i_Handle ) { VBluefishTable::Instance().DestroyObject( i_Handle ); }

  BErr bfcEnumerate( VHandle i_Handle, int* o_pCount )
  {
    if( !o_pCount || !VBluefishTable::Instance().Find( i_Handle ) )
    {
      return Failure;
    }
    *o_pCount = static_cast<int>( VBluefishTable::Instance().PresentCards().size() );
    return Success;
  }

  BErr bfcAttach( VHandle i_Handle, int i_Device ) { return ToResult( VBluefishTable::Instance().Attach( i_Handle, i_Device ) ); }

  BErr bfcDetach( VHandle i_Handle ) { return ToResult( VBluefishTable::Instance().Detach( i_Handle ) ); }

  BErr bfcQueryCardType( VHandle i_Handle, int* o_pType, int i_Device )
  {
    const size_t Cards = VBluefishTable::Instance().PresentCards().size();
    const bool bKnown = i_Device == 0 ? FindAttached( i_Handle ).has_value() : i_Device > 0 && static_cast<size_t>( i_Device ) <= Cards;
    if( !o_pType || !bKnown )
    {
      return Failure;
    }
    *o_pType = SuperNova;
    return Success;
  }

  BErr bfcQueryCardProperty32( VHandle i_Handle, int i_Property, uint32_t* io_pValue )
  {
    const std::optional<VCardObject> Object = FindAttached( i_Handle );
    if( !Object || !io_pValue )
    {
      return Failure;
    }
    if( i_Property == Property::DefaultVideoInputChannel )
    {
      *io_pValue = Object->m_Input + InputChannelA;
      return Success;
    }
    return ToResult( Object->m_pCard->Query( i_Property, *io_pValue ) || ( Object->Input() && Object->Input()->Query( i_Property, *io_pValue ) ) );
  }

  BErr bfcSetCardProperty32( VHandle i_Handle, int i_Property, uint32_t i_Value )
  {
    if( i_Property == Property::DefaultVideoInputChannel )
    {
      return ToResult( i_Value >= InputChannelA && VBluefishTable::Instance().SelectInput( i_Handle, i_Value - InputChannelA ) );
    }
    return WithInput( i_Handle, [=]( VBluefishInput& i_rInput ) { return i_rInput.Set( i_Property, i_Value ); } );
  }

  BErr bfcVideoCaptureStop( VHandle i_Handle )
  {
    return WithInput( i_Handle, []( VBluefishInput& i_rInput ) { return i_rInput.StopCapture(); } );
  }

  BErr bfcWaitVideoInputSync( VHandle i_Handle, unsigned long, unsigned long* o_pFieldCount )
  {
    uint64_t Count = 0;
    const BErr Result = WithInput( i_Handle, [&]( VBluefishInput& i_rInput ) { return i_rInput.WaitForSync( Count ); } );
    if( o_pFieldCount )
    {
      *o_pFieldCount = Count;
    }
    return Result;
  }

  BErr bfcRenderBufferCapture( VHandle i_Handle, unsigned long i_BufferId )
  {
    return WithInput( i_Handle, [=]( VBluefishInput& i_rInput ) { return i_rInput.Capture( static_cast<uint32_t>( i_BufferId ) ); } );
  }

  BErr bfcSystemBufferRead( VHandle i_Handle, unsigned char* o_pTarget, unsigned long i_Size, unsigned long i_BufferId, unsigned long i_Offset )
  {
    return WithInput( i_Handle,
      [=]( VBluefishInput& i_rInput ) { return i_rInput.Read( o_pTarget, i_Size, static_cast<uint32_t>( i_BufferId ), i_Offset ); } );
  }

  BErr bfcDecodeHancFrameEx( VHandle i_Handle, uint32_t, uint32_t* i_pHanc, VHancDecodeRecord* io_pRecord )
  {
    const bool bGiven = i_pHanc && io_pRecord && VBluefishTable::Instance().Find( i_Handle );
    return ToResult( bGiven && DecodeHanc( reinterpret_cast<const uint8_t*>( i_pHanc ), *io_pRecord ) );
  }

  BErr bfcGetVideoInfo( int i_Mode, int i_UpdateMethod, int i_MemoryFormat, uint32_t* o_pWidth, uint32_t* o_pHeight, uint32_t* o_pLineBytes,
    uint32_t* o_pFrameBytes, uint32_t* o_pGoldenBytes )
  {
    const VModeSizes Sizes = SizesOf( static_cast<uint32_t>( i_Mode ), static_cast<uint32_t>( i_MemoryFormat ),
      static_cast<uint32_t>( i_UpdateMethod ) );
    *o_pWidth = Sizes.m_Width;
    *o_pHeight = Sizes.m_Lines;
    *o_pLineBytes = Sizes.m_LineBytes;
    *o_pFrameBytes = Sizes.m_Bytes;
    *o_pGoldenBytes = Sizes.m_GoldenBytes;
    return ToResult( Sizes.m_Bytes > 0 );
  }

  // The functions of the older generation, with their own order of arguments

  uint32_t bfcGetPixelsPerLine( uint32_t i_Mode ) { return SizesOf( i_Mode, MemoryFormat::TwoVUY, UpdateMethod::Frame ).m_Width; }

  uint32_t bfcGetLinesPerFrame( uint32_t i_Mode, uint32_t i_UpdateMethod ) { return SizesOf( i_Mode, MemoryFormat::TwoVUY, i_UpdateMethod ).m_Lines; }

  uint32_t bfcGetBytesPerLine( uint32_t i_Mode, uint32_t i_MemoryFormat )
  {
    return SizesOf( i_Mode, i_MemoryFormat, UpdateMethod::Frame ).m_LineBytes;
  }

  uint32_t bfcGetBytesPerFrame( uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod )
  {
    return SizesOf( i_Mode, i_MemoryFormat, i_UpdateMethod ).m_Bytes;
  }

  uint32_t bfcGetGoldenValue( uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod )
  {
    return SizesOf( i_Mode, i_MemoryFormat, i_UpdateMethod ).m_GoldenBytes;
  }

  IVirtualCardControl* GetVirtualCardControl() { return &VBluefishTable::Instance(); }
}
