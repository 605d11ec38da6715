#include "FileIO/MkvIO/SegmentInfo.h"

#include "FileIO/MkvIO/ElementSetting.h"
#include "FileIO/MkvIO/Format.h"

#include <ebml/EbmlVersion.h>
#include <matroska/KaxInfoData.h>
#include <matroska/KaxSemantic.h>
#include <matroska/KaxVersion.h>

#include <array>
#include <ctime>
#include <random>

namespace MkvIO
{

using namespace libmatroska;

namespace
{

std::array<uint32_t, 4> RandomId()
{
  std::random_device Source;
  return { Source(), Source(), Source(), Source() };
}

}

void FillInfo( KaxInfo& o_rInfo, const std::string& i_rWritingApplication )
{
  libebml::UTFstring Text;
  Text.SetUTF8( i_rWritingApplication );
  Set<KaxWritingApp>( o_rInfo, Text );
  const std::array<uint32_t, 4> Id = RandomId();
  libebml::GetChild<KaxSegmentUID>( o_rInfo ).CopyBuffer( reinterpret_cast<const uint8_t*>( Id.data() ), sizeof( Id ) );
  Set<KaxTimecodeScale>( o_rInfo, TimecodeScale );
  // With the precision of a single float a duration would be off by a frame after ten minutes.
  libebml::GetChild<KaxDuration>( o_rInfo ).SetPrecision( libebml::EbmlFloat::FLOAT_64 );
  SetDuration( o_rInfo, 0 );
  Set<KaxDateUTC>( o_rInfo, static_cast<int64_t>( std::time( nullptr ) ) );
  Text.SetUTF8( "libebml v" + libebml::EbmlCodeVersion + " + zzlibmatroska v" + KaxCodeVersion );
  Set<KaxMuxingApp>( o_rInfo, Text );
}

void SetDuration( KaxInfo& io_rInfo, uint64_t i_Duration ) { Set<KaxDuration>( io_rInfo, static_cast<double>( i_Duration ) ); }

}
