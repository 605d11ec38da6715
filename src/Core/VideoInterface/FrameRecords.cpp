#include "Core/VideoInterface/FrameRecords.h"

#include "Core/VideoInterface/Schemas.h"
#include "Core/VideoInterface/VideoAttributes.h"

#include <functional>
#include <tuple>
#include <type_traits>

namespace KVZ
{

namespace
{

constexpr std::array RadialModelRows = {
  VEnumRow{ VLensDistortionRecord::ETarvo2Parameter, "Tarvo2Parameter" },
  VEnumRow{ VLensDistortionRecord::ETarvo3Parameter, "Tarvo3Parameter" },
  VEnumRow{ VLensDistortionRecord::EBadRadialModel, "BadRadialModel" },
};

constexpr VEnumTable RadialModelTable{ "LensDistortionCalibration.ERadialModel", "Possible lens model types", RadialModelRows };

bool FromName( const std::string& i_rName, VLensDistortionRecord::ERadialModel& o_rModel )
{
  return FindEnumerator( RadialModelTable, i_rName, o_rModel );
}

// A key and what gives the field of a record: a pointer to a member, or a function. TStored is the stored type where that is another one.
template<class TMember, class TStored = void>
struct VField
{
  const char* m_pKey;
  TMember m_Member;
};
template<class TMember>
VField( const char*, TMember ) -> VField<TMember>;

template<auto Member, size_t Index>
constexpr auto ElementOf = []( auto& io_rRecord ) -> auto&
{
  return ( io_rRecord.*Member )[Index];
};

// The fields of a record in the order of their writing. Enumerators travel as names.
template<class TRecord>
constexpr auto Fields = std::tuple<>();

template<>
constexpr auto Fields<VideoFrameInfo> = std::tuple{
  VField{ "VideoFrameInfo.ImageX", &VideoFrameInfo::m_ImageX },
  VField{ "VideoFrameInfo.ImageY", &VideoFrameInfo::m_ImageY },
  VField{ "VideoFrameInfo.ImageWidth", &VideoFrameInfo::m_ImageWidth },
  VField{ "VideoFrameInfo.ImageHeight", &VideoFrameInfo::m_ImageHeight },
  VField{ "VideoFrameInfo.PixelFormat", &VideoFrameInfo::m_PixelFormat },
  VField{ "VideoFrameInfo.Inverted", &VideoFrameInfo::m_bInverted },
  VField{ "VideoFrameInfo.PixelAspectRatio", &VideoFrameInfo::m_PixelAspectRatio },
  VField{ "VideoFrameInfo.InterlacedFormat", &VideoFrameInfo::m_InterlacedFormat },
};

template<>
constexpr auto Fields<AudioFrameInfo> = std::tuple{
  VField{ "AudioFrameInfo.SampleFormat", &AudioFrameInfo::m_SampleFormat },
  VField{ "AudioFrameInfo.SampleRate", &AudioFrameInfo::m_SampleRate },
  VField{ "AudioFrameInfo.Channels", &AudioFrameInfo::m_Channels },
};

template<>
constexpr auto Fields<VTimingRecord> = std::tuple{
  VField{ "TicksPerSecond", &VTimingRecord::m_TicksPerSecond },
  VField{ "FramePeriodInTicks", &VTimingRecord::m_FramePeriodInTicks },
  VField{ "StartOffsetInTicks", &VTimingRecord::m_StartOffsetInTicks },
};

template<>
constexpr auto Fields<VColourRecord> = std::tuple{
  VField{ "Saturation", &VColourRecord::m_Saturation },
  VField{ "GammaCorrection", &VColourRecord::m_GammaCorrection },
};

template<>
constexpr auto Fields<VCameraHardwareRecord> = std::tuple{
  VField{ "CameraHardware.DeviceURN", &VCameraHardwareRecord::m_DeviceURN },
  VField{ "CameraHardware.Type", &VCameraHardwareRecord::m_Type },
  VField{ "CameraHardware.DisplayType", &VCameraHardwareRecord::m_DisplayType },
  VField{ "CameraHardware.SensorWidthInPixels", &VCameraHardwareRecord::m_SensorWidthInPixels },
  VField{ "CameraHardware.SensorHeightInPixels", &VCameraHardwareRecord::m_SensorHeightInPixels },
  VField{ "CameraHardware.PixelAspectRatio", &VCameraHardwareRecord::m_PixelAspectRatio },
};

template<>
constexpr auto Fields<VLensDistortionRecord> = std::tuple{
  VField{ "LensDistortionCalibration.RadialModel", &VLensDistortionRecord::m_RadialModel },
  VField{ "LensDistortionCalibration.RadialDistortionCentre_X", ElementOf<&VLensDistortionRecord::m_Centre, 0> },
  VField{ "LensDistortionCalibration.RadialDistortionCentre_Y", ElementOf<&VLensDistortionRecord::m_Centre, 1> },
  VField{ "LensDistortionCalibration.RadialDistortionParameters_0", ElementOf<&VLensDistortionRecord::m_Parameters, 0> },
  VField{ "LensDistortionCalibration.RadialDistortionParameters_1", ElementOf<&VLensDistortionRecord::m_Parameters, 1> },
  VField{ "LensDistortionCalibration.RadialDistortionParameters_2", ElementOf<&VLensDistortionRecord::m_Parameters, 2> },
};

template<>
constexpr auto Fields<VConversionRecord> = std::tuple{
  VField{ "Container", &VConversionRecord::m_Container },
  VField{ "AudioPayload", &VConversionRecord::m_AudioPayload },
  VField{ "VideoPayload", &VConversionRecord::m_VideoPayload },
  VField{ "VideoFrameInfo.PixelFormat", &VConversionRecord::m_PixelFormat },
};

template<>
constexpr auto Fields<ITimecode> = std::tuple{
  VField<int32_t ITimecode::*, uint32_t>{ "Timecode.Standards", &ITimecode::m_Standard },
  VField{ "Timecode.Hours", &ITimecode::m_Hours },
  VField{ "Timecode.Minutes", &ITimecode::m_Minutes },
  VField{ "Timecode.Seconds", &ITimecode::m_Seconds },
  VField{ "Timecode.Frames", &ITimecode::m_Frames },
  VField{ "Timecode.UserBits", &ITimecode::m_UserBits },
  VField{ "Timecode.Days", &ITimecode::m_Days },
  VField{ "Timecode.TickRemainder", &ITimecode::m_TickRemainder },
  VField{ "Timecode.SubFramePeriod", &ITimecode::m_SubFramePeriod },
};

template<class TStored, class T>
auto ToStored( const T& i_rValue )
{
  if constexpr( std::is_enum_v<T> )
  {
    return ToName( i_rValue );
  }
  else
  {
    return static_cast<std::conditional_t<std::is_void_v<TStored>, T, TStored>>( i_rValue );
  }
}

template<class TStored, class T>
bool FromStored( const TStored& i_rStored, T& o_rValue )
{
  if constexpr( std::is_enum_v<T> )
  {
    return FromName( i_rStored, o_rValue );
  }
  else
  {
    o_rValue = static_cast<T>( i_rStored );
    return true;
  }
}

template<class TRecord>
bool Write( const TRecord& i_rRecord, IVideoAttributes& o_rMap, const std::string& i_rPrefix )
{
  const auto WriteOne = [&]<class TMember, class TStored>( const VField<TMember, TStored>& i_rField )
  { o_rMap.Set( i_rPrefix + i_rField.m_pKey, ToStored<TStored>( std::invoke( i_rField.m_Member, i_rRecord ) ) ); };
  std::apply( [&]( const auto&... i_rField ) { ( WriteOne( i_rField ), ... ); }, Fields<TRecord> );
  return true;
}

// Stops at the first key that is missing, of another type or an unknown name.
template<class TRecord>
bool Read( TRecord& o_rRecord, const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  const auto ReadOne = [&]<class TMember, class TStored>( const VField<TMember, TStored>& i_rField )
  {
    auto& rValue = std::invoke( i_rField.m_Member, o_rRecord );
    auto Stored = ToStored<TStored>( rValue );
    return i_rMap.Get( i_rPrefix + i_rField.m_pKey, Stored ) && FromStored( Stored, rValue );
  };
  return std::apply( [&]( const auto&... i_rField ) { return ( ReadOne( i_rField ) && ... ); }, Fields<TRecord> );
}

// Frame descriptions stand behind a flag that says whether there is one at all.
template<class TRecord>
bool WriteOptional( const TRecord& i_rRecord, bool i_bWhole, const char* i_pKey, IVideoAttributes& o_rMap, const std::string& i_rPrefix )
{
  if( !i_rRecord.IsEmpty() && !i_bWhole )
  {
    return false;
  }
  o_rMap.Set( i_rPrefix + i_pKey, !i_rRecord.IsEmpty() );
  return i_rRecord.IsEmpty() || Write( i_rRecord, o_rMap, i_rPrefix );
}

template<class TRecord>
bool ReadOptional( TRecord& o_rRecord, const char* i_pKey, const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  bool bPresent = false;
  if( !i_rMap.Get( i_rPrefix + i_pKey, bPresent ) || !bPresent )
  {
    o_rRecord = TRecord();
    return true;
  }
  return Read( o_rRecord, i_rMap, i_rPrefix );
}

std::string ConversionPrefix( const std::string& i_rPrefix, size_t i_Index )
{
  return i_rPrefix + "ConversionRecord." + std::to_string( i_Index ) + ".";
}

}

bool VideoFrameInfo::WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix ) const
{
  return WriteOptional( *this, IsWhole(), "VideoFrameInfo.Present", o_rMap, i_rPrefix );
}

bool VideoFrameInfo::ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  return ReadOptional( *this, "VideoFrameInfo.Present", i_rMap, i_rPrefix );
}

bool AudioFrameInfo::WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix ) const
{
  return WriteOptional( *this, m_SampleRate != 0 && m_Channels != 0, "AudioFrameInfo.Present", o_rMap, i_rPrefix );
}

bool AudioFrameInfo::ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  return ReadOptional( *this, "AudioFrameInfo.Present", i_rMap, i_rPrefix );
}

bool VTimingRecord::WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix ) const { return Write( *this, o_rMap, i_rPrefix ); }

bool VTimingRecord::ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix ) { return Read( *this, i_rMap, i_rPrefix ); }

bool VColourRecord::WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix ) const { return Write( *this, o_rMap, i_rPrefix ); }

bool VColourRecord::ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix ) { return Read( *this, i_rMap, i_rPrefix ); }

bool VCameraHardwareRecord::WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix ) const
{
  return Write( *this, o_rMap, i_rPrefix );
}

bool VCameraHardwareRecord::ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  return Read( *this, i_rMap, i_rPrefix );
}

bool VLensDistortionRecord::WriteAttributes( IVideoAttributes& o_rMap, const std::string& i_rPrefix ) const
{
  return Write( *this, o_rMap, i_rPrefix );
}

bool VLensDistortionRecord::ReadAttributes( const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  return Read( *this, i_rMap, i_rPrefix );
}

const VEnumTable& GetEnumTable( VLensDistortionRecord::ERadialModel ) { return RadialModelTable; }

std::string ToName( VLensDistortionRecord::ERadialModel i_Model )
{
  const std::string Name = FindName( RadialModelTable, i_Model );
  return Name.empty() ? "<Unknown>" : Name;
}

bool WriteAttributes( const std::vector<VConversionRecord>& i_rRecords, IVideoAttributes& o_rMap, const std::string& i_rPrefix )
{
  for( size_t Index = 0; Index < i_rRecords.size(); ++Index )
  {
    Write( i_rRecords[Index], o_rMap, ConversionPrefix( i_rPrefix, Index ) );
  }
  return true;
}

bool ReadAttributes( std::vector<VConversionRecord>& o_rRecords, const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  o_rRecords.clear();
  while( i_rMap.Has( ConversionPrefix( i_rPrefix, o_rRecords.size() ) + "Container" ) )
  {
    VConversionRecord Record;
    if( !Read( Record, i_rMap, ConversionPrefix( i_rPrefix, o_rRecords.size() ) ) )
    {
      return false;
    }
    o_rRecords.push_back( std::move( Record ) );
  }
  return true;
}

bool WriteAttributes( const ITimecode& i_rTimecode, IVideoAttributes& o_rMap, const std::string& i_rPrefix )
{
  return Write( i_rTimecode, o_rMap, i_rPrefix );
}

bool ReadAttributes( ITimecode& o_rTimecode, const IVideoAttributes& i_rMap, const std::string& i_rPrefix )
{
  return Read( o_rTimecode, i_rMap, i_rPrefix );
}

}
