// The frame encoder's JPEG against TurboJPEG called by itself, with one compressor and one output buffer for all frames; PNG and TIFF for
// information.
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"
#include "bench/Figures.h"
#include "bench/Measuring.h"

#include <turbojpeg.h>

#include <algorithm>
#include <random>
#include <stdexcept>

namespace
{

using KVZ::IPixelFormat;
using KVZ::IVideoPayload;

constexpr int Width = 1920;
constexpr int Height = 1080;
constexpr int Quality = 90;

// Soft shapes with a camera's noise: compresses about as a filmed frame does.
std::shared_ptr<KVZ::IStandardBuffer> MakeImage()
{
  auto pImage = std::make_shared<KVZ::IStandardBuffer>( size_t{ 3 } * Width * Height );
  std::mt19937 Random( 1 );
  uint8_t* pByte = pImage->Data();
  for( int Y = 0; Y < Height; ++Y )
  {
    for( int X = 0; X < Width; ++X )
    {
      const int Shape = ( X / 240 + Y / 180 ) % 2 * 40;
      const int Noise = static_cast<int>( Random() % 8 );
      *pByte++ = static_cast<uint8_t>( X * 120 / Width + Shape + Noise );
      *pByte++ = static_cast<uint8_t>( Y * 140 / Height + Shape + Noise );
      *pByte++ = static_cast<uint8_t>( 80 + Shape + Noise );
    }
  }
  return pImage;
}

class VBareTurboJPEG
{
public:
  VBareTurboJPEG() : m_Output( tjBufSize( Width, Height, TJSAMP_444 ) ) {}
  ~VBareTurboJPEG() { tjDestroy( m_Handle ); }
  VBareTurboJPEG( const VBareTurboJPEG& ) = delete;
  VBareTurboJPEG& operator=( const VBareTurboJPEG& ) = delete;

  size_t Compress( const uint8_t* i_pPixels )
  {
    unsigned char* pOutput = m_Output.data();
    unsigned long Size = m_Output.size();
    if( tjCompress2( m_Handle, i_pPixels, Width, 0, Height, TJPF_RGB, &pOutput, &Size, TJSAMP_444, Quality, TJFLAG_NOREALLOC ) != 0 )
    {
      throw std::runtime_error( "TurboJPEG refused an image." );
    }
    return Size;
  }

private:
  const tjhandle m_Handle = tjInitCompress();
  std::vector<uint8_t> m_Output;
};

class VEncoding
{
public:
  explicit VEncoding( std::shared_ptr<const KVZ::IBufferConst> i_pImage ) : m_pImage( std::move( i_pImage ) )
  {
    m_Info.m_ImageWidth = Width;
    m_Info.m_ImageHeight = Height;
    m_Info.m_PixelFormat = IPixelFormat::ER8G8B8;
    m_Encoder.SetJPEGQuality( Quality );
  }

  size_t Encode( IVideoPayload::Enum i_Payload )
  {
    KVZ::VBufferList Video{ m_pImage };
    if( !m_Encoder.Encode( m_Allocator, Video, m_Info, i_Payload, IPixelFormat::EUnspecified ) )
    {
      throw std::runtime_error( "The frame encoder refused a frame." );
    }
    return Video.front()->Size();
  }

private:
  static VideoEncoding::VEncoderParts Parts()
  {
    VideoEncoding::VEncoderParts Result;
    Result.m_Compressors = VideoEncoding::ImageCompressors();
    return Result;
  }

  const std::shared_ptr<const KVZ::IBufferConst> m_pImage;
  KVZ::VideoFrameInfo m_Info;
  KVZ::IStandardBufferAllocator m_Allocator{ "Bench" };
  VideoEncoding::VVideoFrameEncoder m_Encoder{ VideoEncoding::EConverter::Software, Parts() };
};

template<class TWork>
double SecondsOf( TWork i_Work )
{
  const double Before = ThreadSeconds();
  i_Work();
  return ThreadSeconds() - Before;
}

double LeastSeconds( VEncoding& io_rEncoding, IVideoPayload::Enum i_Payload, int i_Rounds )
{
  double Least = SecondsOf( [&] { io_rEncoding.Encode( i_Payload ); } );
  for( int Round = 1; Round < i_Rounds; ++Round )
  {
    Least = std::min( Least, SecondsOf( [&] { io_rEncoding.Encode( i_Payload ); } ) );
  }
  return Least;
}

}

// What disturbs a round only ever adds to it, so the cheapest of many tells what the work itself costs.
std::vector<VFigure> MeasureImageCompression( const VBenchOptions& i_rOptions )
{
  const auto pImage = MakeImage();
  VEncoding Encoding( pImage );
  VBareTurboJPEG Bare;
  if( Encoding.Encode( IVideoPayload::EImageJPEG ) != Bare.Compress( pImage->Data() ) )
  {
    throw std::runtime_error( "The frame encoder's JPEG differs from TurboJPEG's." );
  }
  double Ours = 1e9;
  double Theirs = 1e9;
  for( int Round = 0; Round < ( i_rOptions.m_bQuick ? 60 : 400 ); ++Round )
  {
    Theirs = std::min( Theirs, SecondsOf( [&] { Bare.Compress( pImage->Data() ); } ) );
    Ours = std::min( Ours, SecondsOf( [&] { Encoding.Encode( IVideoPayload::EImageJPEG ); } ) );
  }
  const int SlowRounds = i_rOptions.m_bQuick ? 2 : 5;
  return {
    { "compression, JPEG through the encoder over bare TurboJPEG, processor time", Ours / Theirs, "x", 1.03 },
    { "compression, JPEG, 1080p R8G8B8 4:4:4 at quality 90, processor time", Ours * 1e3, "ms", {} },
    { "compression, PNG, the same image", LeastSeconds( Encoding, IVideoPayload::EImagePNG, SlowRounds ) * 1e3, "ms", {} },
    { "compression, TIFF, the same image", LeastSeconds( Encoding, IVideoPayload::EImageTIFF, SlowRounds ) * 1e3, "ms", {} },
  };
}
