#include "bench/FFmpegMuxer.h"

#include <stdexcept>

#ifdef STAGECORE_BENCH_AVFORMAT

extern "C"
{
#include <libavcodec/packet.h>
#include <libavformat/avformat.h>
#include <libavutil/intreadwrite.h>
}

namespace
{

void Require( bool i_bDone, const std::string& i_rWhat )
{
  if( !i_bDone )
  {
    throw std::runtime_error( "FFmpeg's library cannot " + i_rWhat + "." );
  }
}

void KeepMemory( void*, uint8_t* ) {}

}

class VFFmpegMuxer::VImpl
{
public:
  VImpl( const std::string& i_rPath, const VFFmpegVideo& i_rVideo ) : m_pPacket( av_packet_alloc() )
  {
    Require( avformat_alloc_output_context2( &m_pContext, nullptr, i_rVideo.m_Muxer.c_str(), nullptr ) >= 0, "write " + i_rVideo.m_Muxer );
    AVStream* pStream = avformat_new_stream( m_pContext, nullptr );
    Require( pStream && m_pPacket, "make a stream" );
    pStream->time_base = { 1, 25 };
    pStream->avg_frame_rate = { 25, 1 };
    AVCodecParameters& rVideo = *pStream->codecpar;
    rVideo.codec_type = AVMEDIA_TYPE_VIDEO;
    rVideo.codec_id = AV_CODEC_ID_RAWVIDEO;
    rVideo.codec_tag = i_rVideo.m_Tag.empty() ? 0 : AV_RL32( i_rVideo.m_Tag.data() );
    rVideo.format = AV_PIX_FMT_UYVY422;
    rVideo.width = i_rVideo.m_Width;
    rVideo.height = i_rVideo.m_Height;
    rVideo.bits_per_coded_sample = 16;
    Require( avio_open( &m_pContext->pb, i_rPath.c_str(), AVIO_FLAG_WRITE ) >= 0, "make \"" + i_rPath + "\"" );
    // Matroska's muxer wants to be told; the others take no notice.
    AVDictionary* pOptions = nullptr;
    av_dict_set( &pOptions, "allow_raw_vfw", "1", 0 );
    const int Result = avformat_write_header( m_pContext, &pOptions );
    av_dict_free( &pOptions );
    Require( Result >= 0, "write the header" );
  }
  ~VImpl()
  {
    CloseFile();
    avformat_free_context( m_pContext );
    av_packet_free( &m_pPacket );
  }
  VImpl( const VImpl& ) = delete;
  VImpl& operator=( const VImpl& ) = delete;

  void Write( const uint8_t* i_pImage, size_t i_Size )
  {
    // Counted memory that nobody frees: a packet without is copied.
    m_pPacket->buf = av_buffer_create( const_cast<uint8_t*>( i_pImage ), i_Size, &KeepMemory, nullptr, AV_BUFFER_FLAG_READONLY );
    m_pPacket->data = const_cast<uint8_t*>( i_pImage );
    m_pPacket->size = static_cast<int>( i_Size );
    m_pPacket->flags = AV_PKT_FLAG_KEY;
    m_pPacket->pts = av_rescale_q( m_Frames++, { 1, 25 }, m_pContext->streams[0]->time_base );
    m_pPacket->dts = m_pPacket->pts;
    m_pPacket->duration = av_rescale_q( 1, { 1, 25 }, m_pContext->streams[0]->time_base );
    const int Result = av_write_frame( m_pContext, m_pPacket );
    av_packet_unref( m_pPacket );
    Require( Result >= 0, "write a frame" );
  }

  void Close()
  {
    Require( av_write_trailer( m_pContext ) >= 0, "write the end" );
    Require( CloseFile(), "close the file" );
  }

private:
  bool CloseFile() { return !m_pContext || avio_closep( &m_pContext->pb ) >= 0; }

  AVFormatContext* m_pContext = nullptr;
  AVPacket* m_pPacket;
  int64_t m_Frames = 0;
};

bool VFFmpegMuxer::IsAvailable() { return true; }

VFFmpegMuxer::VFFmpegMuxer( const std::string& i_rPath, const VFFmpegVideo& i_rVideo ) : m_pImpl( std::make_unique<VImpl>( i_rPath, i_rVideo ) ) {}

void VFFmpegMuxer::Write( const uint8_t* i_pImage, size_t i_Size ) { m_pImpl->Write( i_pImage, i_Size ); }

void VFFmpegMuxer::Close() { m_pImpl->Close(); }

#else

class VFFmpegMuxer::VImpl
{
};

bool VFFmpegMuxer::IsAvailable() { return false; }

VFFmpegMuxer::VFFmpegMuxer( const std::string&, const VFFmpegVideo& ) { throw std::runtime_error( "This build has no library of FFmpeg." ); }

void VFFmpegMuxer::Write( const uint8_t*, size_t ) {}

void VFFmpegMuxer::Close() {}

#endif

VFFmpegMuxer::~VFFmpegMuxer() = default;
