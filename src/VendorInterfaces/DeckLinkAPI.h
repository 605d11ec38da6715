// The binary interface of the DeckLink runtime library on Linux x86-64, 10.x generation.
//
// Plain Itanium C++ ABI: slots 0 to 2 of every table are IUnknown's, an interface's own operations follow in the order below, and the
// protected virtual destructor, declared last, takes the two slots after them. Neither side ever calls a destructor across the
// boundary: an object ends when its last reference is released. A derived interface appends its operations after the base's
// destructor slots. Never reorder, insert or overload anything here.
//
// The names live in a namespace so that the weak type information of this program and that of a vendor library, loaded with global
// symbols, stay apart.
//
// Rules for both sides: QueryInterface, iterators and every out-parameter that is an interface hand over one reference. Pointers passed
// to callbacks are borrowed for the call. Texts are UTF-8, allocated with malloc and freed by the caller with free().
#pragma once

#include <array>
#include <cstdint>
#include <cstring>

namespace DeckLinkAPI
{

// Negative for failure. The numbers are those of the Linux runtime and differ from the ones on Windows.
using HRESULT = int;
// What AddRef and Release give: 64 bits here.
using ULONG = unsigned long;

constexpr HRESULT MakeResult( uint32_t i_Bits ) { return static_cast<HRESULT>( i_Bits ); }

constexpr HRESULT S_OK = 0;
constexpr HRESULT S_FALSE = 1;
constexpr HRESULT E_NOTIMPL = MakeResult( 0x80000001 );
constexpr HRESULT E_OUTOFMEMORY = MakeResult( 0x80000002 );
constexpr HRESULT E_INVALIDARG = MakeResult( 0x80000003 );
constexpr HRESULT E_NOINTERFACE = MakeResult( 0x80000004 );
constexpr HRESULT E_POINTER = MakeResult( 0x80000005 );
constexpr HRESULT E_HANDLE = MakeResult( 0x80000006 );
constexpr HRESULT E_ABORT = MakeResult( 0x80000007 );
constexpr HRESULT E_FAIL = MakeResult( 0x80000008 );
constexpr HRESULT E_ACCESSDENIED = MakeResult( 0x80000009 );
constexpr HRESULT E_UNEXPECTED = MakeResult( 0x8000FFFF );

// An interface id: the printed digits from left to right. Travels by value in two integer registers.
struct REFIID
{
  unsigned char m_Bytes[16];
};
static_assert( sizeof( REFIID ) == 16 && alignof( REFIID ) == 1 );

inline bool operator==( const REFIID& i_rA, const REFIID& i_rB ) { return std::memcmp( i_rA.m_Bytes, i_rB.m_Bytes, sizeof( i_rA.m_Bytes ) ) == 0; }

constexpr REFIID IID_IUnknown{ { 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0xC0, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x46 } };
constexpr REFIID IID_IDeckLinkDiscovery{ { 0xCD, 0xBF, 0x63, 0x1C, 0xBC, 0x76, 0x45, 0xFA, 0xB4, 0x4D, 0xC5, 0x50, 0x59, 0xBC, 0x61, 0x01 } };
constexpr REFIID IID_IDeckLinkDeviceNotificationCallback{ { 0x49, 0x97, 0x05, 0x3B, 0x0A, 0xDF, 0x4C, 0xC8, 0xAC, 0x70, 0x7A, 0x50, 0xC4, 0xBE, 0x72,
  0x8F } };
constexpr REFIID IID_IDeckLink{ { 0xC4, 0x18, 0xFB, 0xDD, 0x05, 0x87, 0x48, 0xED, 0x8F, 0xE5, 0x64, 0x0F, 0x0A, 0x14, 0xAF, 0x91 } };
constexpr REFIID IID_IDeckLinkAttributes{ { 0xAB, 0xC1, 0x18, 0x43, 0xD9, 0x66, 0x44, 0xCB, 0x96, 0xE2, 0xA1, 0xCB, 0x5D, 0x31, 0x35, 0xC4 } };
// The name under which runtimes of 11.0 and later know the same table.
constexpr REFIID IID_IDeckLinkProfileAttributes{ { 0x17, 0xD4, 0xBF, 0x8E, 0x49, 0x11, 0x47, 0x3A, 0x80, 0xA0, 0x73, 0x1C, 0xF6, 0xFF, 0x34, 0x5B } };
constexpr REFIID IID_IDeckLinkInput{ { 0xAF, 0x22, 0x76, 0x2B, 0xDF, 0xAC, 0x48, 0x46, 0xAA, 0x79, 0xFA, 0x88, 0x83, 0x56, 0x09, 0x95 } };
constexpr REFIID IID_IDeckLinkInputCallback{ { 0xDD, 0x04, 0xE5, 0xEC, 0x74, 0x15, 0x42, 0xAB, 0xAE, 0x4A, 0xE8, 0x0C, 0x4D, 0xFC, 0x04, 0x4A } };
constexpr REFIID IID_IDeckLinkDisplayModeIterator{ { 0x9C, 0x88, 0x49, 0x9F, 0xF6, 0x01, 0x40, 0x21, 0xB8, 0x0B, 0x03, 0x2E, 0x4E, 0xB4, 0x1C,
  0x35 } };
constexpr REFIID IID_IDeckLinkDisplayMode{ { 0x3E, 0xB2, 0xC1, 0xAB, 0x0A, 0x3D, 0x45, 0x23, 0xA3, 0xAD, 0xF4, 0x0D, 0x7F, 0xB1, 0x4E, 0x78 } };
constexpr REFIID IID_IDeckLinkVideoFrame{ { 0x3F, 0x71, 0x6F, 0xE0, 0xF0, 0x23, 0x41, 0x11, 0xBE, 0x5D, 0xEF, 0x44, 0x14, 0xC0, 0x5B, 0x17 } };
constexpr REFIID IID_IDeckLinkVideoInputFrame{ { 0x05, 0xCF, 0xE3, 0x74, 0x53, 0x7C, 0x40, 0x94, 0x9A, 0x57, 0x68, 0x05, 0x25, 0x11, 0x8F, 0x44 } };
constexpr REFIID IID_IDeckLinkAudioInputPacket{ { 0xE4, 0x3D, 0x58, 0x70, 0x28, 0x94, 0x11, 0xDE, 0x8C, 0x30, 0x08, 0x00, 0x20, 0x0C, 0x9A, 0x66 } };
constexpr REFIID IID_IDeckLinkTimecode{ { 0xBC, 0x6C, 0xFB, 0xD3, 0x83, 0x17, 0x43, 0x25, 0xAC, 0x1C, 0x12, 0x16, 0x39, 0x1E, 0x93, 0x40 } };
constexpr REFIID IID_IDeckLinkVideoFrameAncillary{ { 0x73, 0x2E, 0x72, 0x3C, 0xD1, 0xA4, 0x4E, 0x29, 0x9E, 0x8E, 0x4A, 0x88, 0x79, 0x7A, 0x00,
  0x04 } };
constexpr REFIID IID_IDeckLinkIterator{ { 0x50, 0xFB, 0x36, 0xCD, 0x30, 0x63, 0x4B, 0x73, 0xBD, 0xBB, 0x95, 0x80, 0x87, 0xF2, 0xD8, 0xBA } };
constexpr REFIID IID_IDeckLinkAPIInformation{ { 0x7B, 0xEA, 0x3C, 0x68, 0x73, 0x0D, 0x43, 0x22, 0xAF, 0x34, 0x8A, 0x71, 0x52, 0xB5, 0x32, 0xA4 } };
constexpr REFIID IID_IDeckLinkMemoryAllocator{ { 0xB3, 0x6E, 0xB6, 0xE7, 0x9D, 0x29, 0x4A, 0xA8, 0x92, 0xEF, 0x84, 0x3B, 0x87, 0xA2, 0x89, 0xE8 } };
constexpr REFIID IID_IDeckLinkScreenPreviewCallback{ { 0xB1, 0xD3, 0xF4, 0x9A, 0x85, 0xFE, 0x4C, 0x5D, 0x95, 0xC8, 0x0B, 0x5D, 0x5D, 0xCC, 0xD4,
  0x38 } };

// Four letters read as a big-endian number.
constexpr uint32_t FourCharacterCode( const char ( &i_rText )[5] )
{
  uint32_t Code = 0;
  for( int i = 0; i < 4; ++i )
  {
    Code = Code << 8 | static_cast<unsigned char>( i_rText[i] );
  }
  return Code;
}

// Display modes are their four-character codes; this one stands for no known mode.
constexpr uint32_t DisplayModeUnknown = FourCharacterCode( "iunk" );

namespace PixelFormat
{
constexpr uint32_t YUV8Bit = FourCharacterCode( "2vuy" );    // U Y V Y, width * 2 bytes a row
constexpr uint32_t YUV10Bit = FourCharacterCode( "v210" );   // 6 pixels in 16 bytes, rows padded to 128 bytes
constexpr uint32_t ARGB8Bit = 32;                            // A R G B
constexpr uint32_t BGRA8Bit = FourCharacterCode( "BGRA" );   // B G R A, width * 4 bytes a row
constexpr uint32_t RGB10Bit = FourCharacterCode( "r210" );
constexpr uint32_t RGB12Bit = FourCharacterCode( "R12B" );
constexpr uint32_t RGB12BitLittleEndian = FourCharacterCode( "R12L" );
constexpr uint32_t RGBX10BitLittleEndian = FourCharacterCode( "R10l" );
constexpr uint32_t RGBX10Bit = FourCharacterCode( "R10b" );
}

namespace TimecodeFormat
{
constexpr uint32_t RP188VITC1 = FourCharacterCode( "rpv1" );
constexpr uint32_t RP188VITC2 = FourCharacterCode( "rp12" );
constexpr uint32_t RP188LTC = FourCharacterCode( "rplt" );
constexpr uint32_t RP188Any = FourCharacterCode( "rp18" );   // first valid of VITC1, LTC, VITC2
constexpr uint32_t VITCField1 = FourCharacterCode( "vitc" );
constexpr uint32_t VITCField2 = FourCharacterCode( "vit2" );
constexpr uint32_t Serial = FourCharacterCode( "seri" );
}

namespace TimecodeFlag
{
constexpr uint32_t DropFrame = 1u << 0;
constexpr uint32_t FieldMark = 1u << 1;
}

namespace FrameFlag
{
constexpr uint32_t FlippedVertically = 1u << 0;
constexpr uint32_t CapturedAsPsF = 1u << 30;
constexpr uint32_t NoInputSource = 1u << 31;
}

namespace InputFlag
{
constexpr uint32_t Default = 0;
constexpr uint32_t FormatDetection = 1u << 0;
constexpr uint32_t DualStream3D = 1u << 1;
}

namespace FormatChange
{
constexpr uint32_t DisplayMode = 1u << 0;
constexpr uint32_t FieldDominance = 1u << 1;
constexpr uint32_t ColourSpace = 1u << 2;
}

namespace DetectedSignal
{
constexpr uint32_t YCbCr422 = 1;
constexpr uint32_t RGB444 = 2;
constexpr uint32_t DualStream3D = 4;
}

namespace ModeSupport
{
constexpr uint32_t No = 0;
constexpr uint32_t Yes = 1;
constexpr uint32_t YesWithConversion = 2;
}

namespace FieldDominance
{
constexpr uint32_t Unknown = 0;
constexpr uint32_t LowerFieldFirst = FourCharacterCode( "lowr" );
constexpr uint32_t UpperFieldFirst = FourCharacterCode( "uppr" );
constexpr uint32_t Progressive = FourCharacterCode( "prog" );
constexpr uint32_t ProgressiveSegmented = FourCharacterCode( "psf " );
}

namespace DisplayModeFlag
{
constexpr uint32_t Supports3D = 1u << 0;
constexpr uint32_t Rec601 = 1u << 1;
constexpr uint32_t Rec709 = 1u << 2;
}

constexpr uint32_t AudioSampleRate48kHz = 48000;   // the only one
namespace AudioSampleType
{
constexpr uint32_t Int16 = 16;
constexpr uint32_t Int32 = 32;
}

namespace AttributeId
{
constexpr uint32_t SupportsInputFormatDetection = FourCharacterCode( "infd" );   // flag
constexpr uint32_t HasLTCTimecodeInput = FourCharacterCode( "hltc" );            // flag
constexpr uint32_t SupportsFullDuplex = FourCharacterCode( "fdup" );             // flag
constexpr uint32_t MaximumAudioChannels = FourCharacterCode( "mach" );           // int
constexpr uint32_t NumberOfSubDevices = FourCharacterCode( "nsbd" );             // int
constexpr uint32_t SubDeviceIndex = FourCharacterCode( "subi" );                 // int
constexpr uint32_t PersistentId = FourCharacterCode( "peid" );                   // int
constexpr uint32_t TopologicalId = FourCharacterCode( "toid" );                  // int
constexpr uint32_t DeviceGroupId = FourCharacterCode( "dgid" );                  // int
constexpr uint32_t VideoIOSupport = FourCharacterCode( "vios" );                 // int: 1 capture, 2 playback
constexpr uint32_t VideoInputConnections = FourCharacterCode( "vicn" );          // int
constexpr uint32_t DeviceBusType = FourCharacterCode( "dbus" );                  // int
constexpr uint32_t VendorName = FourCharacterCode( "vndr" );                     // text
constexpr uint32_t ModelName = FourCharacterCode( "mdln" );                      // text
constexpr uint32_t DisplayName = FourCharacterCode( "dspn" );                    // text
constexpr uint32_t DeviceHandle = FourCharacterCode( "devh" );                   // text
constexpr uint32_t APIVersion = FourCharacterCode( "vers" );                     // IDeckLinkAPIInformation: int 0xMMmmpp00, or text
}

class IUnknown
{
public:
  virtual HRESULT QueryInterface( REFIID i_Id, void** o_ppObject ) = 0;
  virtual ULONG AddRef() = 0;
  virtual ULONG Release() = 0;
};

class IDeckLink : public IUnknown
{
public:
  virtual HRESULT GetModelName( const char** o_ppName ) = 0;
  virtual HRESULT GetDisplayName( const char** o_ppName ) = 0;

protected:
  virtual ~IDeckLink() = default;
};

// Implemented by the application. The card is borrowed for the call; the same pointer value comes with the removal.
class IDeckLinkDeviceNotificationCallback : public IUnknown
{
public:
  virtual HRESULT DeckLinkDeviceArrived( IDeckLink* i_pCard ) = 0;
  virtual HRESULT DeckLinkDeviceRemoved( IDeckLink* i_pCard ) = 0;

protected:
  virtual ~IDeckLinkDeviceNotificationCallback() = default;
};

class IDeckLinkDiscovery : public IUnknown
{
public:
  // Reports cards already present as well as later ones, on any thread. One callback a discovery object.
  virtual HRESULT InstallDeviceNotifications( IDeckLinkDeviceNotificationCallback* i_pCallback ) = 0;
  virtual HRESULT UninstallDeviceNotifications() = 0;

protected:
  virtual ~IDeckLinkDiscovery() = default;
};

class IDeckLinkAttributes : public IUnknown
{
public:
  virtual HRESULT GetFlag( uint32_t i_Id, bool* o_pValue ) = 0;
  virtual HRESULT GetInt( uint32_t i_Id, int64_t* o_pValue ) = 0;
  virtual HRESULT GetFloat( uint32_t i_Id, double* o_pValue ) = 0;
  virtual HRESULT GetString( uint32_t i_Id, const char** o_ppValue ) = 0;

protected:
  virtual ~IDeckLinkAttributes() = default;
};

class IDeckLinkAPIInformation : public IUnknown
{
public:
  virtual HRESULT GetFlag( uint32_t i_Id, bool* o_pValue ) = 0;
  virtual HRESULT GetInt( uint32_t i_Id, int64_t* o_pValue ) = 0;
  virtual HRESULT GetFloat( uint32_t i_Id, double* o_pValue ) = 0;
  virtual HRESULT GetString( uint32_t i_Id, const char** o_ppValue ) = 0;

protected:
  virtual ~IDeckLinkAPIInformation() = default;
};

// No destructor slots.
class IDeckLinkIterator : public IUnknown
{
public:
  virtual HRESULT Next( IDeckLink** o_ppCard ) = 0;
};

class IDeckLinkDisplayMode : public IUnknown
{
public:
  virtual HRESULT GetName( const char** o_ppName ) = 0;
  virtual uint32_t GetDisplayMode() = 0;
  virtual long GetWidth() = 0;
  virtual long GetHeight() = 0;
  virtual HRESULT GetFrameRate( int64_t* o_pFrameDuration, int64_t* o_pTimeScale ) = 0;
  virtual uint32_t GetFieldDominance() = 0;
  virtual uint32_t GetFlags() = 0;

protected:
  virtual ~IDeckLinkDisplayMode() = default;
};

class IDeckLinkDisplayModeIterator : public IUnknown
{
public:
  // Anything but S_OK is the end of the list.
  virtual HRESULT Next( IDeckLinkDisplayMode** o_ppMode ) = 0;

protected:
  virtual ~IDeckLinkDisplayModeIterator() = default;
};

class IDeckLinkTimecode : public IUnknown
{
public:
  virtual uint32_t GetBCD() = 0;
  virtual HRESULT GetComponents( uint8_t* o_pHours, uint8_t* o_pMinutes, uint8_t* o_pSeconds, uint8_t* o_pFrames ) = 0;
  virtual HRESULT GetString( const char** o_ppTimecode ) = 0;
  virtual uint32_t GetFlags() = 0;
  virtual HRESULT GetTimecodeUserBits( uint32_t* o_pUserBits ) = 0;

protected:
  virtual ~IDeckLinkTimecode() = default;
};

class IDeckLinkVideoFrameAncillary : public IUnknown
{
public:
  virtual HRESULT GetBufferForVerticalBlankingLine( uint32_t i_Line, void** o_ppBuffer ) = 0;
  virtual uint32_t GetPixelFormat() = 0;
  virtual uint32_t GetDisplayMode() = 0;

protected:
  virtual ~IDeckLinkVideoFrameAncillary() = default;
};

class IDeckLinkVideoFrame : public IUnknown
{
public:
  virtual long GetWidth() = 0;
  virtual long GetHeight() = 0;
  virtual long GetRowBytes() = 0;
  virtual uint32_t GetPixelFormat() = 0;
  virtual uint32_t GetFlags() = 0;
  virtual HRESULT GetBytes( void** o_ppBuffer ) = 0;
  // Anything but S_OK, and no object, where the frame carries no timecode of this format.
  virtual HRESULT GetTimecode( uint32_t i_Format, IDeckLinkTimecode** o_ppTimecode ) = 0;
  virtual HRESULT GetAncillaryData( IDeckLinkVideoFrameAncillary** o_ppAncillary ) = 0;

protected:
  virtual ~IDeckLinkVideoFrame() = default;
};

class IDeckLinkVideoInputFrame : public IDeckLinkVideoFrame
{
public:
  // Relative to the stream: restarts with StartStreams. The scale comes last.
  virtual HRESULT GetStreamTime( int64_t* o_pFrameTime, int64_t* o_pFrameDuration, int64_t i_TimeScale ) = 0;
  // The card's free-running clock. The scale comes first.
  virtual HRESULT GetHardwareReferenceTimestamp( int64_t i_TimeScale, int64_t* o_pFrameTime, int64_t* o_pFrameDuration ) = 0;

protected:
  ~IDeckLinkVideoInputFrame() override = default;
};

class IDeckLinkAudioInputPacket : public IUnknown
{
public:
  virtual long GetSampleFrameCount() = 0;
  virtual HRESULT GetBytes( void** o_ppBuffer ) = 0;
  virtual HRESULT GetPacketTime( int64_t* o_pPacketTime, int64_t i_TimeScale ) = 0;

protected:
  virtual ~IDeckLinkAudioInputPacket() = default;
};

// Implemented by the application. Called on a thread of the runtime's; the results are ignored.
class IDeckLinkInputCallback : public IUnknown
{
public:
  // With detection on, while streams run: FormatChange bits, DetectedSignal bits.
  virtual HRESULT VideoInputFormatChanged( uint32_t i_Events, IDeckLinkDisplayMode* i_pNewMode, uint32_t i_DetectedSignal ) = 0;
  // Either may be null.
  virtual HRESULT VideoInputFrameArrived( IDeckLinkVideoInputFrame* i_pVideo, IDeckLinkAudioInputPacket* i_pAudio ) = 0;

protected:
  virtual ~IDeckLinkInputCallback() = default;
};

class IDeckLinkScreenPreviewCallback : public IUnknown
{
public:
  virtual HRESULT DrawFrame( IDeckLinkVideoFrame* i_pFrame ) = 0;

protected:
  virtual ~IDeckLinkScreenPreviewCallback() = default;
};

// No destructor slots.
class IDeckLinkMemoryAllocator : public IUnknown
{
public:
  virtual HRESULT AllocateBuffer( uint32_t i_Size, void** o_ppBuffer ) = 0;
  virtual HRESULT ReleaseBuffer( void* i_pBuffer ) = 0;
  virtual HRESULT Commit() = 0;
  virtual HRESULT Decommit() = 0;
};

class IDeckLinkInput : public IUnknown
{
public:
  // The mode object may be asked for with a null pointer: then none is made.
  virtual HRESULT DoesSupportVideoMode( uint32_t i_DisplayMode, uint32_t i_PixelFormat, uint32_t i_InputFlags, uint32_t* o_pSupport,
    IDeckLinkDisplayMode** o_ppMode ) = 0;
  virtual HRESULT GetDisplayModeIterator( IDeckLinkDisplayModeIterator** o_ppIterator ) = 0;
  virtual HRESULT SetScreenPreviewCallback( IDeckLinkScreenPreviewCallback* i_pCallback ) = 0;
  virtual HRESULT EnableVideoInput( uint32_t i_DisplayMode, uint32_t i_PixelFormat, uint32_t i_InputFlags ) = 0;
  virtual HRESULT DisableVideoInput() = 0;
  virtual HRESULT GetAvailableVideoFrameCount( uint32_t* o_pCount ) = 0;
  virtual HRESULT SetVideoInputFrameMemoryAllocator( IDeckLinkMemoryAllocator* i_pAllocator ) = 0;
  virtual HRESULT EnableAudioInput( uint32_t i_SampleRate, uint32_t i_SampleType, uint32_t i_Channels ) = 0;
  virtual HRESULT DisableAudioInput() = 0;
  virtual HRESULT GetAvailableAudioSampleFrameCount( uint32_t* o_pCount ) = 0;
  virtual HRESULT StartStreams() = 0;
  virtual HRESULT StopStreams() = 0;
  virtual HRESULT PauseStreams() = 0;
  virtual HRESULT FlushStreams() = 0;
  // A null pointer detaches.
  virtual HRESULT SetCallback( IDeckLinkInputCallback* i_pCallback ) = 0;
  virtual HRESULT GetHardwareReferenceClock( int64_t i_TimeScale, int64_t* o_pHardwareTime, int64_t* o_pTimeInFrame, int64_t* o_pTicksPerFrame ) = 0;

protected:
  virtual ~IDeckLinkInput() = default;
};

}
