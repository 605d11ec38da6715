#include "FileIO/ImageSequenceIO/ImageSequenceWriter.h"

#include "Core/VideoInterface/EnumTable.h"
#include "FileIO/ImageSequenceIO/FileNames.h"
#include "FileIO/WriterSupport/AttributeBlock.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <algorithm>

namespace ImageSequenceIO
{

VImageSequenceWriter::VImageSequenceWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder, WriterSupport::VStreamMaker i_StreamMaker )
  : VWriterBase( "ImageSequenceIO" ),
    m_StreamMaker( std::move( i_StreamMaker ) ),
    m_pAllocator( std::make_shared<KVZ::IStandardBufferAllocator>( "Unnamed", "ImageSequenceIO" ) ),
    m_pEncoder( i_pEncoder ? std::move( i_pEncoder ) : std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software ) )
{
}

bool VImageSequenceWriter::DoOpen( const std::string& i_rPath )
{
  const size_t Slash = i_rPath.rfind( '/' );
  const std::string Folder = Slash == std::string::npos ? "." : i_rPath.substr( 0, Slash + 1 );
  const std::string Pattern = Slash == std::string::npos ? i_rPath : i_rPath.substr( Slash + 1 );
  boost::system::error_code Error;
  // Only where it is missing: the library makes an error of "."
  if( !boost::filesystem::is_directory( Folder, Error ) )
  {
    boost::filesystem::create_directories( Folder, Error );
  }
  if( Pattern.empty() || !boost::filesystem::is_directory( Folder, Error ) )
  {
    KVZ_LOG_ERROR( Category(), "File could not be opened." );
    return false;
  }
  m_Folder = Folder;
  m_Pattern = Pattern;
  return true;
}

bool VImageSequenceWriter::DoWriteHeader( const WriterSupport::VHeader& i_rHeader )
{
  m_VideoPayload = i_rHeader.m_VideoPayload;
  m_Video = i_rHeader.m_rVideo;
  m_Timing = i_rHeader.m_rTiming;
  m_StartTimecode = i_rHeader.m_rTimecode;
  return VideoEncoding::PixelFormatForPayloadFormat( m_VideoPayload, i_rHeader.m_rVideo.m_PixelFormat, m_Video.m_PixelFormat ) &&
    EncodeAttributes( i_rHeader ) && WriteSideFile();
}

bool VImageSequenceWriter::EncodeAttributes( const WriterSupport::VHeader& i_rHeader )
{
  const WriterSupport::VRecordingDescription Recording{ i_rHeader.m_rAttributes, i_rHeader.m_rTiming, i_rHeader.m_rColour, i_rHeader.m_rTimecode,
    WriterSupport::ETimingKeys::Always, WriterSupport::ETimecodeKeys::Always };
  return WriterSupport::EncodeAttributes( m_Video, KVZ::AudioFrameInfo(), Recording, Category(), m_Attributes );
}

bool VImageSequenceWriter::WriteSideFile() const
{
  const std::string Path = ( boost::filesystem::path( m_Folder ) / MakeSideFileName( m_Pattern ) ).string();
  std::unique_ptr<UtilsIO::IClosableStream> pStream = m_StreamMaker( Path );
  if( pStream )
  {
    WriterSupport::VWatchedStream File( std::move( pStream ) );
    const bool bWritten = WriterSupport::WriteAttributeBlock( File, m_Attributes.m_Internal ) &&
      WriterSupport::WriteAttributeBlock( File, m_Attributes.m_External );
    if( File.Close() && bWritten )
    {
      return true;
    }
  }
  KVZ_LOG_ERROR( Category(), "Attributes could not be written to \"%1%\".", Path );
  return false;
}

std::string VImageSequenceWriter::FramePath( uint64_t i_FrameKey, const char* i_pExtension ) const
{
  const VFrameName Frame{ i_FrameKey, m_pEncoder->GetFrameNumberDigits(), TimecodeOfFrame( m_StartTimecode, m_Timing, i_FrameKey ) };
  return ( boost::filesystem::path( m_Folder ) / ( MakeFileName( m_Pattern, Frame ) + "." + i_pExtension ) ).string();
}

// Many threads. Changes no member.
bool VImageSequenceWriter::DoWriteFrame( WriterSupport::VFrame& io_rFrame )
{
  if( io_rFrame.m_Key == NoFrameNumber )
  {
    KVZ_LOG_ERROR( Category(), "Frame index must be set." );
    return false;
  }
  const char* pExtension = GetImageExtension( m_VideoPayload );
  if( *pExtension == '\0' )
  {
    KVZ_LOG_ERROR( Category(), "Unsupported video payload." );
    return false;
  }
  const std::string Path = FramePath( io_rFrame.m_Key, pExtension );
  const bool bEncoded = m_pEncoder->Encode( *m_pAllocator, io_rFrame.m_rVideo, io_rFrame.m_rVideoInfo, m_VideoPayload, m_Video.m_PixelFormat );
  if( !bEncoded )
  {
    KVZ_LOG_ERROR( Category(), "Encoding to '%s' failed.", KVZ::NameOrUnspecified( m_VideoPayload ) );
  }
  // A frame that could not be encoded has its empty file, so that the gap in the sequence shows.
  return WriteFile( Path, bEncoded ? io_rFrame.m_rVideo : KVZ::VBufferList() ) && bEncoded;
}

bool VImageSequenceWriter::WriteFile( const std::string& i_rPath, const KVZ::VBufferList& i_rBuffers ) const
{
  std::unique_ptr<UtilsIO::IClosableStream> pStream = m_StreamMaker( i_rPath );
  if( !pStream )
  {
    KVZ_LOG_ERROR( Category(), "Image file \"%1%\" could not be opened.", i_rPath );
    return false;
  }
  WriterSupport::VWatchedStream File( std::move( pStream ) );
  const bool bWritten = std::all_of( i_rBuffers.begin(), i_rBuffers.end(),
    [&File]( const auto& i_rpBuffer ) { return i_rpBuffer->Size() == 0 || File.Write( i_rpBuffer->Data(), i_rpBuffer->Size() ); } );
  if( File.Close() && bWritten )
  {
    return true;
  }
  KVZ_LOG_ERROR( Category(), "Image file \"%1%\" could not be written.", i_rPath );
  return false;
}

bool VImageSequenceWriter::DoClose()
{
  m_Folder.clear();
  m_Pattern.clear();
  return true;
}

}
