// A DeckLink runtime in one process: cards whose every call can be made to fail, and callbacks on the caller's thread.
//
// It is strict where a card is: streams start only when enabled and not running, frames come only while they run, and StopStreams waits
// for a callback that runs on another thread.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "tests/support/FakeDeckLinkFrames.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <algorithm>
#include <cstdint>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace TestSupport::FakeDeckLink
{

using VideoInputHAL::TakeReference;
using VideoInputHAL::VComPointer;

class VDisplayMode : public VObject<IDeckLinkDisplayMode>
{
public:
  explicit VDisplayMode( uint32_t i_Code ) : VObject( IID_IDeckLinkDisplayMode ), m_Code( i_Code ) {}
  HRESULT GetName( const char** ) override { return E_NOTIMPL; }
  uint32_t GetDisplayMode() override { return m_Code; }
  long GetWidth() override { return 0; }
  long GetHeight() override { return 0; }
  HRESULT GetFrameRate( int64_t*, int64_t* ) override { return E_NOTIMPL; }
  uint32_t GetFieldDominance() override { return 0; }
  uint32_t GetFlags() override { return 0; }

private:
  const uint32_t m_Code;
};

class VDisplayModeIterator : public VObject<IDeckLinkDisplayModeIterator>
{
public:
  explicit VDisplayModeIterator( std::vector<uint32_t> i_Codes ) : VObject( IID_IDeckLinkDisplayModeIterator ), m_Codes( std::move( i_Codes ) ) {}
  HRESULT Next( IDeckLinkDisplayMode** o_ppMode ) override
  {
    const bool bMore = m_Next < m_Codes.size();
    *o_ppMode = bMore ? new VDisplayMode( m_Codes[m_Next++] ) : nullptr;
    return bMore ? S_OK : S_FALSE;
  }

private:
  const std::vector<uint32_t> m_Codes;
  size_t m_Next = 0;
};

class VAttributes : public VObject<IDeckLinkAttributes>
{
public:
  VAttributes() : VObject( IID_IDeckLinkAttributes ) {}
  HRESULT GetFlag( uint32_t i_Id, bool* o_pValue ) override
  {
    *o_pValue = true;
    return i_Id == AttributeId::SupportsInputFormatDetection ? S_OK : E_INVALIDARG;
  }
  HRESULT GetInt( uint32_t, int64_t* ) override { return E_NOTIMPL; }
  HRESULT GetFloat( uint32_t, double* ) override { return E_NOTIMPL; }
  HRESULT GetString( uint32_t, const char** ) override { return E_NOTIMPL; }
};

inline std::string CodeText( uint32_t i_Code )
{
  std::string Text;
  for( int Shift = 24; Shift >= 0; Shift -= 8 )
  {
    Text += static_cast<char>( i_Code >> Shift );
  }
  return Text;
}

class VInput : public VObject<IDeckLinkInput>
{
public:
  VInput() : VObject( IID_IDeckLinkInput ) {}

  // Set before the calls that they are about
  std::vector<uint32_t> m_ModeCodes{ FourCharacterCode( "ntsc" ), FourCharacterCode( "Hp25" ), FourCharacterCode( "Hp60" ) };
  std::set<std::string> m_Failures;         // names of operations
  std::function<void()> m_OnStopStreams;    // at the beginning of StopStreams
  std::function<void()> m_OnStartStreams;   // at the end of StartStreams
  bool m_bStopWaits = true;                 // StopStreams waits for callbacks
  bool m_bHoldsCallback = true;             // the runtime holds a reference of its own during a callback

  // What was called, in order, SetCallback and queries left out: "EnableVideoInput Hp25 2vuy 1".
  std::vector<std::string> Calls() const { return Locked( m_Calls ); }
  void ForgetCalls()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Calls.clear();
  }
  bool IsRunning() const { return Locked( m_State ) == EState::Running; }
  IDeckLinkInputCallback* Callback() const { return Locked( m_pCallback ).get(); }
  // Until so many callbacks are under way at once.
  void WaitForCallbacks( size_t i_Count )
  {
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    m_CallbacksChanged.wait( Lock, [&] { return m_InCallback.size() >= i_Count; } );
  }

  // On the calling thread, which stands for one of the runtime's. False, and no callback, while the streams do not run.
  bool DeliverFrame( const VFrameContent& i_rFrame, const std::optional<VAudioContent>& i_rAudio = std::nullopt )
  {
    return CallBack(
      [&]( IDeckLinkInputCallback& i_rCallback )
      {
        const auto pFrame = TakeReference( new VFrame( i_rFrame ) );
        const auto pAudio = TakeReference( i_rAudio ? new VAudioPacket( *i_rAudio ) : nullptr );
        i_rCallback.VideoInputFrameArrived( pFrame.get(), pAudio.get() );
      } );
  }
  bool DeliverAudioOnly( const VAudioContent& i_rAudio )
  {
    return CallBack( [&]( IDeckLinkInputCallback& i_rCallback )
      { i_rCallback.VideoInputFrameArrived( nullptr, TakeReference( new VAudioPacket( i_rAudio ) ).get() ); } );
  }
  bool DeliverFormat( uint32_t i_Mode, uint32_t i_DetectedSignal )
  {
    return CallBack( [&]( IDeckLinkInputCallback& i_rCallback )
      { i_rCallback.VideoInputFormatChanged( FormatChange::DisplayMode, TakeReference( new VDisplayMode( i_Mode ) ).get(), i_DetectedSignal ); } );
  }

  HRESULT DoesSupportVideoMode( uint32_t, uint32_t, uint32_t, uint32_t*, IDeckLinkDisplayMode** ) override { return E_NOTIMPL; }
  HRESULT GetDisplayModeIterator( IDeckLinkDisplayModeIterator** o_ppIterator ) override
  {
    const HRESULT Result = FailureOf( "GetDisplayModeIterator" );
    *o_ppIterator = Result == S_OK ? new VDisplayModeIterator( m_ModeCodes ) : nullptr;
    return Result;
  }
  HRESULT SetScreenPreviewCallback( IDeckLinkScreenPreviewCallback* ) override { return E_NOTIMPL; }
  HRESULT EnableVideoInput( uint32_t i_DisplayMode, uint32_t i_PixelFormat, uint32_t i_InputFlags ) override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Calls.push_back( "EnableVideoInput " + CodeText( i_DisplayMode ) + " " + CodeText( i_PixelFormat ) + " " + std::to_string( i_InputFlags ) );
    const bool bKnown = std::find( m_ModeCodes.begin(), m_ModeCodes.end(), i_DisplayMode ) != m_ModeCodes.end() && i_PixelFormat != 0;
    m_bEnabled = m_bEnabled || bKnown;
    return bKnown ? FailureOf( "EnableVideoInput" ) : E_INVALIDARG;
  }
  HRESULT DisableVideoInput() override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Calls.push_back( "DisableVideoInput" );
    m_bEnabled = false;
    return S_OK;
  }
  HRESULT GetAvailableVideoFrameCount( uint32_t* ) override { return E_NOTIMPL; }
  HRESULT SetVideoInputFrameMemoryAllocator( IDeckLinkMemoryAllocator* ) override { return E_NOTIMPL; }
  HRESULT EnableAudioInput( uint32_t i_SampleRate, uint32_t i_SampleType, uint32_t i_Channels ) override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Calls.push_back(
      "EnableAudioInput " + std::to_string( i_SampleRate ) + " " + std::to_string( i_SampleType ) + " " + std::to_string( i_Channels ) );
    return FailureOf( "EnableAudioInput" );
  }
  HRESULT DisableAudioInput() override { return S_OK; }
  HRESULT GetAvailableAudioSampleFrameCount( uint32_t* ) override { return E_NOTIMPL; }
  HRESULT StartStreams() override
  {
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Calls.push_back( "StartStreams" );
      if( !m_bEnabled || m_State == EState::Running )
      {
        return m_bEnabled ? E_ACCESSDENIED : E_UNEXPECTED;
      }
      if( FailureOf( "StartStreams" ) < 0 )
      {
        return E_FAIL;
      }
      m_State = EState::Running;
    }
    Run( m_OnStartStreams );
    return S_OK;
  }
  HRESULT StopStreams() override
  {
    Run( m_OnStopStreams );
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    m_Calls.push_back( "StopStreams" );
    m_State = EState::Stopped;
    const auto Self = boost::this_thread::get_id();
    m_CallbacksChanged.wait( Lock, [&] { return !m_bStopWaits || m_InCallback.size() == m_InCallback.count( Self ); } );
    return S_OK;
  }
  HRESULT PauseStreams() override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Calls.push_back( "PauseStreams" );
    m_State = m_State == EState::Running ? EState::Paused : m_State;
    return S_OK;
  }
  HRESULT FlushStreams() override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Calls.push_back( "FlushStreams" );
    return S_OK;
  }
  HRESULT SetCallback( IDeckLinkInputCallback* i_pCallback ) override
  {
    if( FailureOf( "SetCallback" ) < 0 && i_pCallback )
    {
      return E_FAIL;
    }
    VComPointer<IDeckLinkInputCallback> pCallback( i_pCallback );   // the former one goes without the lock
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_pCallback.swap( pCallback );
    return S_OK;
  }
  HRESULT GetHardwareReferenceClock( int64_t, int64_t*, int64_t*, int64_t* ) override { return E_NOTIMPL; }

private:
  enum class EState
  {
    Stopped,
    Paused,
    Running
  };

  template<class T>
  T Locked( const T& i_rValue ) const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return i_rValue;
  }
  HRESULT FailureOf( const char* i_pOperation ) const { return m_Failures.count( i_pOperation ) ? E_FAIL : S_OK; }
  static void Run( const std::function<void()>& i_rHook )
  {
    if( i_rHook )
    {
      i_rHook();
    }
  }

  bool CallBack( const std::function<void( IDeckLinkInputCallback& )>& i_rCall )
  {
    IDeckLinkInputCallback* pCallback = nullptr;
    VComPointer<IDeckLinkInputCallback> pHeld;
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      if( !m_pCallback || m_State != EState::Running )
      {
        return false;
      }
      pCallback = m_pCallback.get();
      pHeld = m_bHoldsCallback ? m_pCallback : nullptr;
      m_InCallback.insert( boost::this_thread::get_id() );
      m_CallbacksChanged.notify_all();
    }
    const VComPointer<VInput> pSelf( this );   // the callback may let the input go
    i_rCall( *pCallback );
    pHeld.reset();
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_InCallback.erase( m_InCallback.find( boost::this_thread::get_id() ) );
    m_CallbacksChanged.notify_all();
    return true;
  }

  mutable boost::mutex m_Mutex;
  boost::condition_variable m_CallbacksChanged;
  std::vector<std::string> m_Calls;
  VComPointer<IDeckLinkInputCallback> m_pCallback;
  std::multiset<boost::thread::id> m_InCallback;
  EState m_State = EState::Stopped;
  bool m_bEnabled = false;
};

class VCard : public VObject<IDeckLink>
{
public:
  VCard() : VObject( IID_IDeckLink ) {}

  std::vector<REFIID> m_Refused;   // interfaces that the card does not know
  REFIID m_AttributesId = IID_IDeckLinkAttributes;
  VInput& Input() { return *m_pInput; }

  HRESULT QueryInterface( REFIID i_Id, void** o_ppObject ) override
  {
    *o_ppObject = nullptr;
    if( std::find( m_Refused.begin(), m_Refused.end(), i_Id ) != m_Refused.end() )
    {
      return E_NOINTERFACE;
    }
    if( i_Id == m_AttributesId )
    {
      *o_ppObject = static_cast<IDeckLinkAttributes*>( new VAttributes );
      return S_OK;
    }
    return i_Id == IID_IDeckLinkInput ? m_pInput->QueryInterface( i_Id, o_ppObject ) : VObject::QueryInterface( i_Id, o_ppObject );
  }
  HRESULT GetModelName( const char** ) override { return E_NOTIMPL; }
  HRESULT GetDisplayName( const char** ) override { return E_NOTIMPL; }

private:
  const VComPointer<VInput> m_pInput = TakeReference( new VInput );
};

class VDiscovery : public VObject<IDeckLinkDiscovery>
{
public:
  VDiscovery() : VObject( IID_IDeckLinkDiscovery ) {}

  // On the calling thread; does nothing without a callback.
  void Arrive( VCard& i_rCard ) { CallBack( &IDeckLinkDeviceNotificationCallback::DeckLinkDeviceArrived, i_rCard ); }
  void Remove( VCard& i_rCard ) { CallBack( &IDeckLinkDeviceNotificationCallback::DeckLinkDeviceRemoved, i_rCard ); }
  IDeckLinkDeviceNotificationCallback* Callback() { return m_pCallback.get(); }

  HRESULT InstallDeviceNotifications( IDeckLinkDeviceNotificationCallback* i_pCallback ) override
  {
    m_pCallback = i_pCallback;
    return S_OK;
  }
  HRESULT UninstallDeviceNotifications() override
  {
    m_pCallback = nullptr;
    return S_OK;
  }

private:
  void CallBack( HRESULT ( IDeckLinkDeviceNotificationCallback::*i_pOperation )( IDeckLink* ), VCard& i_rCard )
  {
    if( const auto pCallback = m_pCallback )
    {
      ( pCallback.get()->*i_pOperation )( &i_rCard );
    }
  }
  VComPointer<IDeckLinkDeviceNotificationCallback> m_pCallback;
};

}
