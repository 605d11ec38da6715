#include "cards/common/ClipInput.h"

#include "cards/common/CardSpec.h"
#include "cards/common/ChildProcess.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <sstream>
#include <tuple>

namespace VirtualCards
{

namespace
{

using nlohmann::json;

constexpr int ProbeSeconds = 30;
constexpr double SameRate = 1e-4;   // 24000/1001 written as 23.976 is the same; 24 is not
constexpr uint32_t OptionsFormChannels = 2;
constexpr const char* Accepted = "; accepted: a file or URL with pictures that FFmpeg can open, or FFmpeg input options beginning with \"-\"";

// "30000/1001"
double ParseRate( const std::string& i_rText )
{
  double Numerator = 0;
  double Denominator = 1;
  char Slash = 0;
  std::istringstream Stream( i_rText );
  Stream >> Numerator >> Slash >> Denominator;
  return Stream && Slash == '/' && Denominator > 0 ? Numerator / Denominator : 0.0;
}

bool IsQuarterTurned( const json& i_rStream )
{
  for( const json& rData : i_rStream.value( "side_data_list", json::array() ) )
  {
    const auto Rotation = rData.find( "rotation" );
    if( Rotation != rData.end() && Rotation->is_number() )
    {
      return std::lround( std::abs( Rotation->get<double>() ) ) % 180 == 90;
    }
  }
  return false;
}

void ReadPictures( const json& i_rStream, VClipInput& o_rInput )
{
  o_rInput.m_Width = i_rStream.value( "width", 0u );
  o_rInput.m_Height = i_rStream.value( "height", 0u );
  if( IsQuarterTurned( i_rStream ) )
  {
    std::swap( o_rInput.m_Width, o_rInput.m_Height );
  }
  o_rInput.m_FrameRate = ParseRate( i_rStream.value( "avg_frame_rate", std::string() ) );
  if( o_rInput.m_FrameRate <= 0 )
  {
    o_rInput.m_FrameRate = ParseRate( i_rStream.value( "r_frame_rate", std::string() ) );
  }
  const std::string Order = i_rStream.value( "field_order", std::string() );
  o_rInput.m_bInterlaced = Order == "tt" || Order == "bb" || Order == "tb" || Order == "bt";
}

// The first of each kind of stream, as FFmpeg's "-map 0:v:0" takes it.
bool ReadStreams( const std::string& i_rText, VClipInput& o_rInput )
{
  const json Document = json::parse( i_rText, nullptr, false );
  bool bPictures = false;
  if( !Document.is_object() )
  {
    return false;
  }
  for( const json& rStream : Document.value( "streams", json::array() ) )
  {
    const std::string Type = rStream.value( "codec_type", std::string() );
    if( Type == "video" && !bPictures )
    {
      bPictures = true;
      ReadPictures( rStream, o_rInput );
    }
    if( Type == "audio" && o_rInput.m_AudioChannels == 0 )
    {
      o_rInput.m_AudioChannels = rStream.value( "channels", 0u );
    }
  }
  return bPictures;
}

std::optional<VClipInput> ProbeFile( const std::string& i_rText, std::string& o_rError )
{
  VClipInput Input;
  Input.m_Options = { "-i", i_rText };
  const VProgramOutput Output = RunProgram( { "ffprobe", "-v", "error", "-print_format", "json", "-show_streams", "-i", i_rText }, ProbeSeconds );
  if( !Output.m_bSucceeded )
  {
    o_rError = LastLine( Output.m_Errors ) + Accepted;
    return std::nullopt;
  }
  if( !ReadStreams( Output.m_Output, Input ) )
  {
    o_rError = i_rText + ": holds no pictures" + Accepted;
    return std::nullopt;
  }
  return Input;
}

// In FFmpeg's description of its inputs: "  Stream #1:0: Audio: pcm_s16le, 44100 Hz, mono".
void FindSound( const std::string& i_rDescription, VClipInput& o_rInput )
{
  constexpr std::string_view Stream = "Stream #";
  const std::string Inputs = i_rDescription.substr( 0, i_rDescription.find( "\nOutput #0" ) );
  const size_t Sound = Inputs.find( ": Audio: " );
  const size_t Begin = Sound != std::string::npos ? Inputs.rfind( Stream, Sound ) : std::string::npos;
  if( Begin != std::string::npos )
  {
    o_rInput.m_AudioInput = static_cast<uint32_t>( std::strtoul( Inputs.c_str() + Begin + Stream.size(), nullptr, 10 ) );
    o_rInput.m_AudioChannels = OptionsFormChannels;
  }
}

// ffprobe does not know all of ffmpeg's input options, so ffmpeg itself is asked for one picture.
std::optional<VClipInput> ProbeOptions( const std::string& i_rText, std::string& o_rError )
{
  const std::optional<std::vector<std::string>> Options = SplitOptions( i_rText );
  if( !Options )
  {
    o_rError = "\"" + i_rText + "\": a quotation does not end" + Accepted;
    return std::nullopt;
  }
  VClipInput Input;
  Input.m_Options = *Options;
  Input.m_bOptionsForm = true;
  std::vector<std::string> Command{ "ffmpeg", "-nostdin", "-hide_banner" };
  Command.insert( Command.end(), Options->begin(), Options->end() );
  Command.insert( Command.end(), { "-map", "0:v:0", "-frames:v", "1", "-f", "null", "-" } );
  const VProgramOutput Output = RunProgram( Command, ProbeSeconds );
  if( !Output.m_bSucceeded )
  {
    o_rError = LastLine( Output.m_Errors ) + Accepted;
    return std::nullopt;
  }
  FindSound( Output.m_Errors, Input );
  return Input;
}

bool IsSameRate( double i_Rate, const KVZ::VVideoStandardRow& i_rStandard )
{
  const double Rate = double{ 1.0 } * i_rStandard.m_RateNumerator / i_rStandard.m_RateDenominator;
  return std::abs( i_Rate - Rate ) < Rate * SameRate;
}

std::string PictureFilter( const VClipInput& i_rInput, const VPictureFormat& i_rFormat )
{
  std::string Filter;
  if( i_rInput.m_Width != i_rFormat.Width() || i_rInput.m_Height != i_rFormat.Height() )
  {
    const std::string Size = std::to_string( i_rFormat.Width() ) + ":" + std::to_string( i_rFormat.Height() );
    Filter = "scale=" + Size + ":force_original_aspect_ratio=decrease,pad=" + Size + ":(ow-iw)/2:(oh-ih)/2,setsar=1";
  }
  if( !IsSameRate( i_rInput.m_FrameRate, *i_rFormat.m_pStandard ) )
  {
    Filter += ( Filter.empty() ? "fps=" : ",fps=" ) + std::to_string( i_rFormat.m_pStandard->m_RateNumerator ) + "/" +
      std::to_string( i_rFormat.m_pStandard->m_RateDenominator );
  }
  if( i_rFormat.m_PixelFormat == KVZ::IPixelFormat::ELuminance8 )
  {
    // FFmpeg's own grey has the whole range of a byte; a signal's luma has not.
    Filter += ( Filter.empty() ? "" : "," ) + std::string( "format=yuv422p,extractplanes=y" );
  }
  return Filter;
}

std::vector<std::string> PictureEncoding( KVZ::IPixelFormat::Enum i_Format )
{
  switch( i_Format )
  {
    case KVZ::IPixelFormat::EU10Y10V10Y10: return { "-c:v", "v210" };
    case KVZ::IPixelFormat::EB8G8R8u8: return { "-pix_fmt", "bgra" };
    case KVZ::IPixelFormat::ER8G8B8u8: return { "-pix_fmt", "rgba" };
    case KVZ::IPixelFormat::EB8G8R8: return { "-pix_fmt", "bgr24" };
    case KVZ::IPixelFormat::ER8G8B8: return { "-pix_fmt", "rgb24" };
    case KVZ::IPixelFormat::EY8U8Y8V8: return { "-pix_fmt", "yuyv422" };
    case KVZ::IPixelFormat::ELuminance8: return { "-pix_fmt", "gray" };
    default: return { "-pix_fmt", "uyvy422" };
  }
}

void Append( std::vector<std::string>& io_rCommand, const std::vector<std::string>& i_rWords )
{
  io_rCommand.insert( io_rCommand.end(), i_rWords.begin(), i_rWords.end() );
}

}

std::optional<std::vector<std::string>> SplitOptions( const std::string& i_rText )
{
  std::vector<std::string> Words;
  bool bWord = false;
  char Quote = 0;
  for( size_t i = 0; i < i_rText.size(); ++i )
  {
    const char Char = i_rText[i];
    if( Quote == 0 && ( Char == ' ' || Char == '\t' || Char == '\n' ) )
    {
      bWord = false;
      continue;
    }
    if( !bWord )
    {
      Words.emplace_back();
      bWord = true;
    }
    if( Char == Quote )
    {
      Quote = 0;
    }
    else if( Quote == 0 && ( Char == '\'' || Char == '"' ) )
    {
      Quote = Char;
    }
    else if( Char == '\\' && Quote != '\'' )
    {
      if( ++i == i_rText.size() )
      {
        return std::nullopt;
      }
      Words.back() += i_rText[i];
    }
    else
    {
      Words.back() += Char;
    }
  }
  return Quote == 0 ? std::optional( Words ) : std::nullopt;
}

std::optional<VClipInput> ProbeClip( const std::string& i_rText, std::string& o_rError )
{
  return i_rText.starts_with( "-" ) ? ProbeOptions( i_rText, o_rError ) : ProbeFile( i_rText, o_rError );
}

KVZ::IVideoStandard::Enum NearestStandard( const VCardKind& i_rKind, const VClipInput& i_rInput )
{
  if( i_rInput.m_Width == 0 || i_rInput.m_Height == 0 || i_rInput.m_FrameRate <= 0 )
  {
    return DefaultStandard;
  }
  const auto Distance = [&]( KVZ::IVideoStandard::Enum i_Standard )
  {
    const KVZ::VVideoStandardRow& rRow = *KVZ::FindVideoStandard( i_Standard );
    const double Size = std::abs( std::log( 1.0 * i_rInput.m_Width / rRow.m_Width ) ) +
      std::abs( std::log( 1.0 * i_rInput.m_Height / rRow.m_Height ) );
    const double Rate = IsSameRate( i_rInput.m_FrameRate, rRow )
      ? 0.0
      : std::abs( std::log( i_rInput.m_FrameRate * rRow.m_RateDenominator / rRow.m_RateNumerator ) );
    const int Scan = i_rInput.m_bInterlaced == ( rRow.m_Scan == KVZ::EScan::Interlaced ) ? ( rRow.m_Scan == KVZ::EScan::SegmentedFrame ? 1 : 0 ) : 2;
    return std::tuple( Size, Rate, Scan );
  };
  return *std::min_element( i_rKind.m_Standards.begin(), i_rKind.m_Standards.end(),
    [&]( KVZ::IVideoStandard::Enum i_A, KVZ::IVideoStandard::Enum i_B ) { return Distance( i_A ) < Distance( i_B ); } );
}

std::vector<std::string> ClipCommand( const VClipInput& i_rInput, const VPictureFormat& i_rFormat )
{
  std::vector<std::string> Command{ "ffmpeg", "-nostdin", "-v", "error" };
  Append( Command, i_rInput.m_Options );
  Append( Command, { "-map", "0:v:0" } );
  const std::string Filter = PictureFilter( i_rInput, i_rFormat );
  if( !Filter.empty() )
  {
    Append( Command, { "-vf", Filter } );
  }
  Append( Command, { "-fps_mode", "passthrough" } );
  Append( Command, PictureEncoding( i_rFormat.m_PixelFormat ) );
  Append( Command, { "-f", "rawvideo", "pipe:1" } );
  if( i_rInput.m_AudioChannels > 0 )
  {
    Append( Command,
      { "-map", std::to_string( i_rInput.m_AudioInput ) + ":a:0", "-ar", "48000", "-ac", std::to_string( i_rInput.m_AudioChannels ), "-c:a",
        "pcm_s32le", "-f", "s32le", "pipe:" + std::to_string( ClipSoundDescriptor ) } );
  }
  return Command;
}

}
