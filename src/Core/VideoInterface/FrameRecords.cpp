#include "Core/VideoInterface/FrameRecords.h"

#include "Core/VideoInterface/Schemas.h"
#include "Core/VideoInterface/VideoAttributes.h"

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

// Each record lists its fields once, in VFields; these two carry the list into a map and back. Enumerators travel as names.

class VFieldWriter
{
public:
  VFieldWriter( IVideoAttributes& o_rAttributes, const std::string& i_rPrefix ) : m_rAttributes( o_rAttributes ), m_Prefix( i_rPrefix ) {}

  template<class T>
  void Field( const char* i_pKey, const T& i_rValue )
  {
    if constexpr( std::is_enum_v<T> )
    {
      m_rAttributes.Set( m_Prefix + i_pKey, ToName( i_rValue ) );
    }
    else
    {
      m_rAttributes.Set( m_Prefix + i_pKey, i_rValue );
    }
  }

  template<class TStored, class T>
  void FieldAs( const char* i_pKey, const T& i_rValue )
  {
    Field( i_pKey, static_cast<TStored>( i_rValue ) );
  }

private:
  IVideoAttributes& m_rAttributes;
  const std::string m_Prefix;
};

// Stops at the first key that is missing, of another type or an unknown name.
class VFieldReader
{
public:
  VFieldReader( const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix ) : m_rAttributes( i_rAttributes ), m_Prefix( i_rPrefix ) {}

  template<class T>
  void Field( const char* i_pKey, T& o_rValue )
  {
    if constexpr( std::is_enum_v<T> )
    {
      std::string Name;
      Field( i_pKey, Name );
      m_bGood = m_bGood && FromName( Name, o_rValue );
    }
    else
    {
      m_bGood = m_bGood && m_rAttributes.Get( m_Prefix + i_pKey, o_rValue );
    }
  }

  template<class TStored, class T>
  void FieldAs( const char* i_pKey, T& o_rValue )
  {
    TStored Stored{};
    Field( i_pKey, Stored );
    if( m_bGood )
    {
      o_rValue = static_cast<T>( Stored );
    }
  }

  bool IsGood() const { return m_bGood; }

private:
  const IVideoAttributes& m_rAttributes;
  const std::string m_Prefix;
  bool m_bGood = true;
};

template<class TRecord>
struct VFields;

template<>
struct VFields<VideoFrameInfo>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.Field( "VideoFrameInfo.ImageX", i_rRecord.m_ImageX );
    i_rVisitor.Field( "VideoFrameInfo.ImageY", i_rRecord.m_ImageY );
    i_rVisitor.Field( "VideoFrameInfo.ImageWidth", i_rRecord.m_ImageWidth );
    i_rVisitor.Field( "VideoFrameInfo.ImageHeight", i_rRecord.m_ImageHeight );
    i_rVisitor.Field( "VideoFrameInfo.PixelFormat", i_rRecord.m_PixelFormat );
    i_rVisitor.Field( "VideoFrameInfo.Inverted", i_rRecord.m_bInverted );
    i_rVisitor.Field( "VideoFrameInfo.PixelAspectRatio", i_rRecord.m_PixelAspectRatio );
    i_rVisitor.Field( "VideoFrameInfo.InterlacedFormat", i_rRecord.m_InterlacedFormat );
  }
};

template<>
struct VFields<AudioFrameInfo>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.Field( "AudioFrameInfo.SampleFormat", i_rRecord.m_SampleFormat );
    i_rVisitor.Field( "AudioFrameInfo.SampleRate", i_rRecord.m_SampleRate );
    i_rVisitor.Field( "AudioFrameInfo.Channels", i_rRecord.m_Channels );
  }
};

template<>
struct VFields<VTimingRecord>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.Field( "TicksPerSecond", i_rRecord.m_TicksPerSecond );
    i_rVisitor.Field( "FramePeriodInTicks", i_rRecord.m_FramePeriodInTicks );
    i_rVisitor.Field( "StartOffsetInTicks", i_rRecord.m_StartOffsetInTicks );
  }
};

template<>
struct VFields<VColourRecord>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.Field( "Saturation", i_rRecord.m_Saturation );
    i_rVisitor.Field( "GammaCorrection", i_rRecord.m_GammaCorrection );
  }
};

template<>
struct VFields<VCameraHardwareRecord>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.Field( "CameraHardware.DeviceURN", i_rRecord.m_DeviceURN );
    i_rVisitor.Field( "CameraHardware.Type", i_rRecord.m_Type );
    i_rVisitor.Field( "CameraHardware.DisplayType", i_rRecord.m_DisplayType );
    i_rVisitor.Field( "CameraHardware.SensorWidthInPixels", i_rRecord.m_SensorWidthInPixels );
    i_rVisitor.Field( "CameraHardware.SensorHeightInPixels", i_rRecord.m_SensorHeightInPixels );
    i_rVisitor.Field( "CameraHardware.PixelAspectRatio", i_rRecord.m_PixelAspectRatio );
  }
};

template<>
struct VFields<VLensDistortionRecord>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.Field( "LensDistortionCalibration.RadialModel", i_rRecord.m_RadialModel );
    i_rVisitor.Field( "LensDistortionCalibration.RadialDistortionCentre_X", i_rRecord.m_Centre[0] );
    i_rVisitor.Field( "LensDistortionCalibration.RadialDistortionCentre_Y", i_rRecord.m_Centre[1] );
    i_rVisitor.Field( "LensDistortionCalibration.RadialDistortionParameters_0", i_rRecord.m_Parameters[0] );
    i_rVisitor.Field( "LensDistortionCalibration.RadialDistortionParameters_1", i_rRecord.m_Parameters[1] );
    i_rVisitor.Field( "LensDistortionCalibration.RadialDistortionParameters_2", i_rRecord.m_Parameters[2] );
  }
};

template<>
struct VFields<VConversionRecord>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.Field( "Container", i_rRecord.m_Container );
    i_rVisitor.Field( "AudioPayload", i_rRecord.m_AudioPayload );
    i_rVisitor.Field( "VideoPayload", i_rRecord.m_VideoPayload );
    i_rVisitor.Field( "VideoFrameInfo.PixelFormat", i_rRecord.m_PixelFormat );
  }
};

template<>
struct VFields<ITimecode>
{
  static void Visit( auto& i_rRecord, auto& i_rVisitor )
  {
    i_rVisitor.template FieldAs<uint32_t>( "Timecode.Standards", i_rRecord.m_Standard );
    i_rVisitor.Field( "Timecode.Hours", i_rRecord.m_Hours );
    i_rVisitor.Field( "Timecode.Minutes", i_rRecord.m_Minutes );
    i_rVisitor.Field( "Timecode.Seconds", i_rRecord.m_Seconds );
    i_rVisitor.Field( "Timecode.Frames", i_rRecord.m_Frames );
    i_rVisitor.Field( "Timecode.UserBits", i_rRecord.m_UserBits );
    i_rVisitor.Field( "Timecode.Days", i_rRecord.m_Days );
    i_rVisitor.Field( "Timecode.TickRemainder", i_rRecord.m_TickRemainder );
    i_rVisitor.Field( "Timecode.SubFramePeriod", i_rRecord.m_SubFramePeriod );
  }
};

template<class TRecord>
bool WriteFields( const TRecord& i_rRecord, IVideoAttributes& o_rAttributes, const std::string& i_rPrefix )
{
  VFieldWriter Writer( o_rAttributes, i_rPrefix );
  VFields<TRecord>::Visit( i_rRecord, Writer );
  return true;
}

template<class TRecord>
bool ReadFields( TRecord& o_rRecord, const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  VFieldReader Reader( i_rAttributes, i_rPrefix );
  VFields<TRecord>::Visit( o_rRecord, Reader );
  return Reader.IsGood();
}

// Frame descriptions stand behind a flag that says whether there is one at all.
template<class TRecord>
bool WriteOptional( const TRecord& i_rRecord, bool i_bWhole, const char* i_pKey, IVideoAttributes& o_rAttributes, const std::string& i_rPrefix )
{
  if( !i_rRecord.IsEmpty() && !i_bWhole )
  {
    return false;
  }
  o_rAttributes.Set( i_rPrefix + i_pKey, !i_rRecord.IsEmpty() );
  return i_rRecord.IsEmpty() || WriteFields( i_rRecord, o_rAttributes, i_rPrefix );
}

template<class TRecord>
bool ReadOptional( TRecord& o_rRecord, const char* i_pKey, const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  bool bPresent = false;
  if( !i_rAttributes.Get( i_rPrefix + i_pKey, bPresent ) || !bPresent )
  {
    o_rRecord = TRecord();
    return true;
  }
  return ReadFields( o_rRecord, i_rAttributes, i_rPrefix );
}

std::string ConversionPrefix( const std::string& i_rPrefix, size_t i_Index )
{
  return i_rPrefix + "ConversionRecord." + std::to_string( i_Index ) + ".";
}

}

bool VideoFrameInfo::WriteAttributes( IVideoAttributes& o_rAttributes, const std::string& i_rPrefix ) const
{
  return WriteOptional( *this, IsWhole(), "VideoFrameInfo.Present", o_rAttributes, i_rPrefix );
}

bool VideoFrameInfo::ReadAttributes( const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  return ReadOptional( *this, "VideoFrameInfo.Present", i_rAttributes, i_rPrefix );
}

bool AudioFrameInfo::WriteAttributes( IVideoAttributes& o_rAttributes, const std::string& i_rPrefix ) const
{
  return WriteOptional( *this, m_SampleRate != 0 && m_Channels != 0, "AudioFrameInfo.Present", o_rAttributes, i_rPrefix );
}

bool AudioFrameInfo::ReadAttributes( const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  return ReadOptional( *this, "AudioFrameInfo.Present", i_rAttributes, i_rPrefix );
}

bool VTimingRecord::WriteAttributes( IVideoAttributes& o_rAttributes, const std::string& i_rPrefix ) const
{
  return WriteFields( *this, o_rAttributes, i_rPrefix );
}

bool VTimingRecord::ReadAttributes( const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  return ReadFields( *this, i_rAttributes, i_rPrefix );
}

bool VColourRecord::WriteAttributes( IVideoAttributes& o_rAttributes, const std::string& i_rPrefix ) const
{
  return WriteFields( *this, o_rAttributes, i_rPrefix );
}

bool VColourRecord::ReadAttributes( const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  return ReadFields( *this, i_rAttributes, i_rPrefix );
}

bool VCameraHardwareRecord::WriteAttributes( IVideoAttributes& o_rAttributes, const std::string& i_rPrefix ) const
{
  return WriteFields( *this, o_rAttributes, i_rPrefix );
}

bool VCameraHardwareRecord::ReadAttributes( const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  return ReadFields( *this, i_rAttributes, i_rPrefix );
}

bool VLensDistortionRecord::WriteAttributes( IVideoAttributes& o_rAttributes, const std::string& i_rPrefix ) const
{
  return WriteFields( *this, o_rAttributes, i_rPrefix );
}

bool VLensDistortionRecord::ReadAttributes( const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  return ReadFields( *this, i_rAttributes, i_rPrefix );
}

const VEnumTable& GetEnumTable( VLensDistortionRecord::ERadialModel ) { return RadialModelTable; }

std::string ToName( VLensDistortionRecord::ERadialModel i_Model )
{
  const std::string Name = FindName( RadialModelTable, i_Model );
  return Name.empty() ? "<Unknown>" : Name;
}

bool WriteAttributes( const std::vector<VConversionRecord>& i_rRecords, IVideoAttributes& o_rAttributes, const std::string& i_rPrefix )
{
  for( size_t Index = 0; Index < i_rRecords.size(); ++Index )
  {
    WriteFields( i_rRecords[Index], o_rAttributes, ConversionPrefix( i_rPrefix, Index ) );
  }
  return true;
}

bool ReadAttributes( std::vector<VConversionRecord>& o_rRecords, const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  o_rRecords.clear();
  while( i_rAttributes.Has( ConversionPrefix( i_rPrefix, o_rRecords.size() ) + "Container" ) )
  {
    VConversionRecord Record;
    if( !ReadFields( Record, i_rAttributes, ConversionPrefix( i_rPrefix, o_rRecords.size() ) ) )
    {
      return false;
    }
    o_rRecords.push_back( std::move( Record ) );
  }
  return true;
}

bool WriteAttributes( const ITimecode& i_rTimecode, IVideoAttributes& o_rAttributes, const std::string& i_rPrefix )
{
  return WriteFields( i_rTimecode, o_rAttributes, i_rPrefix );
}

bool ReadAttributes( ITimecode& o_rTimecode, const IVideoAttributes& i_rAttributes, const std::string& i_rPrefix )
{
  return ReadFields( o_rTimecode, i_rAttributes, i_rPrefix );
}

}
