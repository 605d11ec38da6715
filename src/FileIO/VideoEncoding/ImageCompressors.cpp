#include "FileIO/VideoEncoding/ImageCompressors.h"

#include "FileIO/JPEGIO/JPEGWriter.h"
#include "FileIO/PNGIO/PNGIO.h"
#include "FileIO/TIFFIO/TIFFIO.h"

namespace VideoEncoding
{

namespace
{

using UtilsMemory::VByteVector;
using VLibraryFinder = std::function<const ImageMagickWrapper::VLibrary&( const char* i_pCategory )>;

std::map<KVZ::IVideoPayload::Enum, VCompressor> MakeRows( const VLibraryFinder& i_rLibrary )
{
  return {
    { KVZ::IVideoPayload::EImageJPEG,
      []( const VCompressionInput& i_rIn, VByteVector& o_rOut, VByteVector& io_rScratch )
      { return JPEGIO::JPEGWriter( i_rIn.m_pPixels, i_rIn.m_Size, i_rIn.m_rInfo, i_rIn.m_JPEGQuality, o_rOut, io_rScratch ); } },
    { KVZ::IVideoPayload::EImagePNG,
      [i_rLibrary]( const VCompressionInput& i_rIn, VByteVector& o_rOut, VByteVector& )
      { return PNGIO::PNGWriter( i_rIn.m_pPixels, i_rIn.m_Size, i_rIn.m_rInfo, o_rOut, i_rLibrary( PNGIO::Category ) ); } },
    { KVZ::IVideoPayload::EImageTIFF,
      [i_rLibrary]( const VCompressionInput& i_rIn, VByteVector& o_rOut, VByteVector& )
      { return TIFFIO::TIFFWriter( i_rIn.m_pPixels, i_rIn.m_Size, i_rIn.m_rInfo, o_rOut, i_rLibrary( TIFFIO::Category ) ); } },
  };
}

}

std::map<KVZ::IVideoPayload::Enum, VCompressor> ImageCompressors() { return MakeRows( &ImageMagickWrapper::Instance ); }

std::map<KVZ::IVideoPayload::Enum, VCompressor> ImageCompressors( const ImageMagickWrapper::VLibrary& i_rLibrary )
{
  return MakeRows( [&i_rLibrary]( const char* ) -> const ImageMagickWrapper::VLibrary& { return i_rLibrary; } );
}

}
