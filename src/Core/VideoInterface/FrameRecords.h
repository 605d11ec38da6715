// The plain records that describe a frame and a recording. Each writes itself into a map of attributes and reads itself back.
//
// Every key is put behind i_rPrefix. ReadAttributes is false when a key is missing or of another type; fields read before it stay changed.
#pragma once

#include "Core/VideoInterface/AudioPayload.h"
#include "Core/VideoInterface/AudioSampleFormat.h"
#include "Core/VideoInterface/InterlacedFormat.h"
#include "Core/VideoInterface/PixelFormat.h"
#include "Core/VideoInterface/Timecode.h"
#include "Core/VideoInterface/VideoContainer.h"
#include "Core/VideoInterface/VideoPayload.h"

#include <array>
#include <cstdint>
#include <string>
#include <vector>

namespace KVZ
{

class IVideoAttributes;

// The image of a frame. It opens the header of every frame block, so the order of the fields is binding.
struct VideoFrameInfo
{
  uint32_t m_ImageX = 0;
  uint32_t m_ImageY = 0;
  uint32_t m_ImageWidth = 0;    // pixels
  uint32_t m_ImageHeight = 0;   // lines
  uint16_t m_PixelAspectNumerator = 1;
  uint16_t m_PixelAspectDenominator = 1;
  IPixelFormat::Enum m_PixelFormat = IPixelFormat::EUnspecified;
  bool m_bInverted = false;   // stored bottom-up
  double m_PixelAspectRatio = 0.0;
  IInterlacedFormat::Enum m_InterlacedFormat = IInterlacedFormat::EUnspecified;

  bool operator==( const VideoFrameInfo& ) const = default;

  // Every field at its default.
  bool IsEmpty() const { return *this == VideoFrameInfo(); }
  // Width, height and pixel format are known.
  bool IsWhole() const { return m_ImageWidth != 0 && m_ImageHeight != 0 && m_PixelFormat != IPixelFormat::EUnspecified; }

  // An empty record writes its "Present" key as false and no more; one that is neither empty nor whole writes nothing and gives false.
  bool WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} ) const;
  bool ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );
};

struct AudioFrameInfo
{
  IAudioSampleFormat::Enum m_SampleFormat = IAudioSampleFormat::EUnspecified;
  uint32_t m_SampleRate = 0;   // samples a second
  uint32_t m_Channels = 0;

  bool operator==( const AudioFrameInfo& ) const = default;

  bool IsEmpty() const { return *this == AudioFrameInfo(); }
  // Format, rate and channels are all non-zero: there is audio.
  bool HasAudio() const { return m_SampleFormat != IAudioSampleFormat::EUnspecified && m_SampleRate != 0 && m_Channels != 0; }

  // The same rule as for VideoFrameInfo; whole means a rate and channels.
  bool WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} ) const;
  bool ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );
};

struct VTimingRecord
{
  uint32_t m_TicksPerSecond = 135000000;
  uint32_t m_FramePeriodInTicks = 0;
  int64_t m_StartOffsetInTicks = 0;

  bool operator==( const VTimingRecord& ) const = default;
  bool WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} ) const;
  bool ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );
};

struct VColourRecord
{
  float m_Saturation = 1.0f;
  float m_GammaCorrection = 1.0f;

  bool operator==( const VColourRecord& ) const = default;
  bool WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} ) const;
  bool ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );
};

struct VCameraHardwareRecord
{
  std::string m_DeviceURN;
  std::string m_Type;
  std::string m_DisplayType;
  uint32_t m_SensorWidthInPixels = 0;
  uint32_t m_SensorHeightInPixels = 0;
  double m_PixelAspectRatio = 0.0;

  bool operator==( const VCameraHardwareRecord& ) const = default;
  bool WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} ) const;
  bool ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );
};

// Lens calibration; the model's enumeration is "LensDistortionCalibration.ERadialModel".
struct VLensDistortionRecord
{
  enum ERadialModel : int32_t
  {
    ETarvo2Parameter = 0,
    ETarvo3Parameter = 1,
    EBadRadialModel = 2
  };

  ERadialModel m_RadialModel = EBadRadialModel;
  std::array<double, 2> m_Centre{};   // pixels
  std::array<double, 3> m_Parameters{};

  bool operator==( const VLensDistortionRecord& ) const = default;
  bool WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} ) const;
  bool ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );
};

// "<Unknown>" for a value without a name.
std::string ToName( VLensDistortionRecord::ERadialModel i_Model );

// One step that a recording passed through; a list of them is stored as "ConversionRecord.0.", "ConversionRecord.1." and so on.
struct VConversionRecord
{
  std::string m_Container = "Unspecified";   // names of enumerators, "Unspecified" where unset
  std::string m_AudioPayload = "Unspecified";
  std::string m_VideoPayload = "Unspecified";
  std::string m_PixelFormat = "Unspecified";

  bool operator==( const VConversionRecord& ) const = default;
};
bool WriteAttributes( const std::vector<VConversionRecord>& i_rRecords, IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} );
bool ReadAttributes( std::vector<VConversionRecord>& o_rRecords, const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );

// All nine fields, valid or not: who stores a start timecode asks IsValid first.
bool WriteAttributes( const ITimecode& i_rTimecode, IVideoAttributes& o_rMap, const std::string& i_rPrefix = {} );
bool ReadAttributes( ITimecode& o_rTimecode, const IVideoAttributes& i_rMap, const std::string& i_rPrefix = {} );

}
