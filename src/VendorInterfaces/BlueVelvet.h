// The Bluefish444 runtime library on Linux x86-64, driver generation 6: its flat functions as the library exports them, and on top of
// them the card object and the functions of the vendor's object interface, under that interface's names.
//
// The flat functions have C linkage. A handle stands for one card object; results are 0 for success, and nothing else is said about failures.
// unsigned long has 64 bits here. Modes, formats and update methods are the vendor's numbers.
#pragma once

#include <cstdint>

namespace BlueVelvet
{

using BErr = int;   // 0 is success
using VHandle = void*;

// Card properties by number, each with a 32-bit value.
namespace Property
{
constexpr int VideoDualLinkInput = 1;
constexpr int VideoDualLinkInputSignalFormatType = 3;
constexpr int VideoInputSignalVideoMode = 24;   // the mode detected on the input
constexpr int VideoInputUpdateType = 33;
constexpr int VideoInputMemoryFormat = 34;
constexpr int DefaultVideoInputChannel = 45;   // which input an attached object works on; to be set before anything else
constexpr int VideoInputEngine = 57;
constexpr int RoutingMatrix = 71;
constexpr int ProductId = 95;
constexpr int InvalidVideoModeFlag = 105;   // what the driver gives for "no signal"; differs from driver to driver
constexpr int CardFeatureStreamInfo = 113;
constexpr int CardFeatureConnectorInfo = 114;
}

// Independent 4:2:2 signals on the links.
constexpr uint32_t SignalFormatIndependent422 = 2;

namespace UpdateMethod
{
constexpr uint32_t Field = 0;
constexpr uint32_t Frame = 1;
}

namespace VideoEngine
{
constexpr uint32_t FrameStore = 0;
}

namespace MemoryFormat
{
constexpr uint32_t BV8 = 2;    // Y U Y V
constexpr uint32_t V210 = 3;   // 6 pixels in 16 bytes, rows padded to 128 bytes
constexpr uint32_t RGBA = 4;
constexpr uint32_t ARGBPC = 6;   // B G R A in memory
constexpr uint32_t TwoVUY = 8;   // U Y V Y
constexpr uint32_t BGR = 9;
constexpr uint32_t RGB = 16;
constexpr uint32_t YUVAlpha = 17;
}

// Channel numbers: inputs A to D.
constexpr uint32_t InputChannelA = 2;
constexpr uint32_t MostInputs = 4;

// A buffer id is the buffer's number with what is captured into it, and for reading what is read from it.
namespace Buffer
{
constexpr uint32_t NumberMask = 0x0FFF;
constexpr uint32_t KindMask = 0xF000;
constexpr uint32_t Image = 0x0000;
constexpr uint32_t ImageVbiHanc = 0x1000;
constexpr uint32_t ImageVbi = 0x2000;
constexpr uint32_t Hanc = 0x5000;
constexpr uint32_t ImageHanc = 0x6000;
constexpr uint32_t DataMask = 0xF0000;
constexpr uint32_t DataImage = 0x00000;
constexpr uint32_t DataHanc = 0x40000;
}

// Size of the ancillary data of a frame, as the decoder takes it: page-aligned memory.
constexpr uint32_t HancBytes = 0x40000;

namespace SampleFlag
{
constexpr uint32_t Bits32 = 0;
constexpr uint32_t BigEndian = 2;
constexpr uint32_t Bits16 = 8;
constexpr uint32_t Bits24 = 0x80;
}

// Places in VHancDecodeRecord::m_Timecodes.
namespace TimecodePlace
{
constexpr uint32_t RP188VITC = 0;
constexpr uint32_t RP188LTC = 1;
constexpr uint32_t SDVITC = 2;
constexpr uint32_t ExternalLTC = 3;
}

// In and out of hanc_decoder_ex. Packed to one byte.
#pragma pack( push, 1 )
struct VHancDecodeRecord
{
  void* m_pSamples = nullptr;   // in: where interleaved samples go
  uint32_t m_ChannelMask = 0;   // in: mono channels 1 to 8 are bits 0 to 7, 9 to 16 are bits 10 to 17
  uint32_t m_SampleFlags = 0;   // in
  uint32_t m_Samples = 0;       // out: decoded, of all channels together
  uint64_t m_Timecodes[7] = {};
  void* m_pPackets = nullptr;   // in: where other ancillary packets go, or null
  uint32_t m_PacketBytes = 0;
  uint32_t m_Packets = 0;
  uint32_t m_AudioSource = 0;    // in: 0 embedded, 1 AES
  uint32_t m_Scratch[16] = {};   // the decoder's own, zero at first
  uint32_t m_SplitMask = 0;      // the decoder's own, zero at first
  uint32_t m_MostSamples = 0;    // in: of each channel, what the memory holds
  uint32_t m_Padding[124] = {};
};
#pragma pack( pop )
static_assert( sizeof( VHancDecodeRecord ) == 664 );

// The library's functions, by their exported names.
struct VFlatFunctions
{
  VHandle ( *bfcFactory )() = nullptr;
  void ( *bfcDestroy )( VHandle ) = nullptr;
  BErr ( *bfcEnumerate )( VHandle, int* o_pCount ) = nullptr;
  BErr ( *bfcAttach )( VHandle, int i_Device ) = nullptr;   // from 1
  BErr ( *bfcDetach )( VHandle ) = nullptr;
  BErr ( *bfcQueryCardType )( VHandle, int* o_pType, int i_Device ) = nullptr;   // 0 is the attached one
  BErr ( *bfcQueryCardProperty32 )( VHandle, int i_Property, uint32_t* io_pValue ) = nullptr;
  BErr ( *bfcSetCardProperty32 )( VHandle, int i_Property, uint32_t i_Value ) = nullptr;
  BErr ( *bfcVideoCaptureStop )( VHandle ) = nullptr;
  BErr ( *bfcWaitVideoInputSync )( VHandle, unsigned long i_UpdateMethod, unsigned long* o_pFieldCount ) = nullptr;
  BErr ( *bfcRenderBufferCapture )( VHandle, unsigned long i_BufferId ) = nullptr;
  BErr (
    *bfcSystemBufferRead )( VHandle, unsigned char* o_pTarget, unsigned long i_Size, unsigned long i_BufferId, unsigned long i_Offset ) = nullptr;
  BErr ( *bfcDecodeHancFrameEx )( VHandle, uint32_t i_CardType, uint32_t* i_pHanc, VHancDecodeRecord* io_pRecord ) = nullptr;

  // Sizes. Newer libraries have the first, older ones the others; note where the memory format stands.
  BErr ( *bfcGetVideoInfo )( int i_Mode, int i_UpdateMethod, int i_MemoryFormat, uint32_t* o_pWidth, uint32_t* o_pHeight, uint32_t* o_pLineBytes,
    uint32_t* o_pFrameBytes, uint32_t* o_pGoldenBytes ) = nullptr;
  uint32_t ( *bfcGetPixelsPerLine )( uint32_t i_Mode ) = nullptr;
  uint32_t ( *bfcGetLinesPerFrame )( uint32_t i_Mode, uint32_t i_UpdateMethod ) = nullptr;
  uint32_t ( *bfcGetBytesPerLine )( uint32_t i_Mode, uint32_t i_MemoryFormat ) = nullptr;
  uint32_t ( *bfcGetGoldenValue )( uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod ) = nullptr;

  // Everything that CBlueVelvet4 needs is there.
  bool IsComplete() const;
};

// A card object: attached to a card it is that card, or one input of it. Not for several threads at once.
class CBlueVelvet4
{
public:
  CBlueVelvet4( const VFlatFunctions& i_rFunctions, VHandle i_Handle ) : m_rFunctions( i_rFunctions ), m_Handle( i_Handle ) {}
  CBlueVelvet4( const CBlueVelvet4& ) = delete;
  CBlueVelvet4& operator=( const CBlueVelvet4& ) = delete;

  BErr device_enumerate( int& o_rCount );
  BErr device_attach( int i_Device );   // from 1
  BErr device_detach();
  BErr has_video_cardtype( int& o_rType );   // of the attached card
  BErr QueryCardProperty( int i_Property, uint32_t& o_rValue );
  BErr SetCardProperty( int i_Property, uint32_t i_Value );
  // Ends what another engine may have left running, which keeps properties from being set.
  BErr video_capture_stop();
  // Blocks until the next frame of the input. The field count advances by two a frame.
  BErr wait_input_video_synch( uint32_t i_UpdateMethod, uint64_t& o_rFieldCount );
  // The buffer that the card fills from its next frame on.
  BErr render_buffer_capture( uint32_t i_BufferId );
  // Blocks until the bytes are there.
  BErr system_buffer_read( uint8_t* o_pTarget, uint64_t i_Size, uint32_t i_BufferId );

  const VFlatFunctions& Functions() const { return m_rFunctions; }
  VHandle Handle() const { return m_Handle; }

private:
  const VFlatFunctions& m_rFunctions;
  const VHandle m_Handle;
};

// Null where the library makes none.
CBlueVelvet4* BlueVelvetFactory4( const VFlatFunctions& i_rFunctions );
void BlueVelvetDestroy( CBlueVelvet4* i_pCard );

// Bytes of one frame buffer, rounded as the card needs. These four give 0 for what the library does not know.
uint32_t BlueVelvetGolden( const VFlatFunctions& i_rFunctions, uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod );
uint32_t BlueVelvetLinePixels( const VFlatFunctions& i_rFunctions, uint32_t i_Mode );
uint32_t BlueVelvetLineBytes( const VFlatFunctions& i_rFunctions, uint32_t i_Mode, uint32_t i_MemoryFormat );
uint32_t BlueVelvetFrameLines( const VFlatFunctions& i_rFunctions, uint32_t i_Mode, uint32_t i_UpdateMethod );

// Decodes sound and timecode out of a frame's ancillary data.
bool hanc_decoder_ex( CBlueVelvet4& i_rCard, uint32_t i_CardType, uint32_t* i_pHanc, VHancDecodeRecord& io_rRecord );

}
