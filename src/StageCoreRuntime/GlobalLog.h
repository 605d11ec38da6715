// The log: categories with a level each, messages with a numeric level and a source position.
//
//   KVZ_LOG( "CaptureBuffer", 6, "%1% Buffer: Forcing new Sync Session", m_Name );
//
// A category is looked up by name once per call site and kept. The arguments are evaluated, and the text formatted, only if the
// category's level allows the message. Every operation may be called from any thread, and no lock is held across a sink's
// observer, so an observer may log.
#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <type_traits>
#include <variant>

namespace KVZ
{
// A lower number is more important. A level allows all messages whose number is not above it.
namespace LogLevel
{
constexpr int None = 0;
constexpr int Error = 2;
constexpr int Warning = 3;
constexpr int Information = 5;
constexpr int Detail = 6;
}

// One category. Made by the log, lives until the process ends.
class VLogCategory
{
public:
  explicit VLogCategory( std::string i_Name ) : m_Name( std::move( i_Name ) ) {}
  VLogCategory( const VLogCategory& ) = delete;
  VLogCategory& operator=( const VLogCategory& ) = delete;

  const std::string& Name() const { return m_Name; }
  bool IsAllowed( int i_Level ) const { return i_Level <= m_Level.load( std::memory_order_relaxed ); }

  // The log's own: the highest level that any sink or observer wants of this category.
  void SetLevel( int i_Level ) { m_Level.store( i_Level, std::memory_order_relaxed ); }

private:
  const std::string m_Name;
  std::atomic<int> m_Level{ LogLevel::Warning };
};

// One message as it goes to the sinks. The views are valid during the call that hands it over.
struct VLogRecord
{
  std::string_view m_Category{};
  int m_Level = LogLevel::Error;
  std::string_view m_Text{};
  const char* m_pFile = "";
  int m_Line = 0;
};

// One argument of a message. Characters and bytes count as numbers, enumerations as their value.
class VLogArgument
{
public:
  using VValue = std::variant<int32_t, uint32_t, int64_t, uint64_t, double, const void*, std::string_view>;

  template<class T>
  VLogArgument( const T& i_rValue ) : m_Value( ToValue( i_rValue ) )
  {
  }

  const VValue& Value() const { return m_Value; }

private:
  template<class T>
  static VValue ToValue( const T& i_rValue )
  {
    if constexpr( std::is_enum_v<T> )
    {
      return ToValue( static_cast<std::underlying_type_t<T>>( i_rValue ) );
    }
    else if constexpr( std::is_integral_v<T> )
    {
      using VSigned = std::conditional_t<sizeof( T ) <= 4, int32_t, int64_t>;
      using VUnsigned = std::conditional_t<sizeof( T ) <= 4, uint32_t, uint64_t>;
      return static_cast<std::conditional_t<std::is_signed_v<T>, VSigned, VUnsigned>>( i_rValue );
    }
    else if constexpr( std::is_floating_point_v<T> )
    {
      return static_cast<double>( i_rValue );
    }
    else if constexpr( std::is_convertible_v<const T&, const char*> )
    {
      const char* pText = i_rValue;
      return std::string_view( pText ? pText : "(null)" );
    }
    else if constexpr( std::is_convertible_v<const T&, std::string_view> )
    {
      return std::string_view( i_rValue );
    }
    else
    {
      static_assert( std::is_pointer_v<T>, "a log argument is a number, an enumeration, a text or a pointer" );
      return static_cast<const void*>( i_rValue );
    }
  }

  VValue m_Value;
};

class ILogCategorised
{
public:
  // Finds or makes a category. Takes a lock; callers keep the reference.
  virtual const VLogCategory& Category( std::string_view i_Name ) = 0;

  // Hands a finished text to all sinks that want this category and level.
  virtual void Write( const VLogCategory& i_rCategory, int i_Level, const char* i_pFile, int i_Line, std::string_view i_Text ) = 0;

protected:
  ~ILogCategorised() = default;
};

// The process's one log. Usable before main and until the process's very end.
ILogCategorised& GlobalLog();

// The category of a name known only at run time, to be kept by the caller: LogCategory( "Hal." + Name ).
inline const VLogCategory& LogCategory( std::string_view i_Name ) { return GlobalLog().Category( i_Name ); }

// Formats a message: %1% placeholders, or printf forms (%s, %d, %i, %u, %.2f, 0x%x), not both in one text; "%%" is a percent sign.
// The arguments must match the placeholders in number. Never throws: a text that cannot be formatted gives
// Cannot Format Log Message "..." with the text in place. Text from outside goes in as an argument, never as the format.
std::string FormatLogMessage( std::string_view i_Format, const VLogArgument* i_pArguments, size_t i_Count );

struct VLogOptions
{
  int m_ConsoleLevel = LogLevel::Warning;   // standard error
  std::string m_FilePath{};                 // empty for none
  int m_FileLevel = LogLevel::Information;
  size_t m_FileBytes = 10 * 1024 * 1024;           // size at which the file is rotated
  size_t m_FileCount = 3;                          // rotated files that are kept beside the current one
  std::map<std::string, int> m_CategoryLevels{};   // by category name, in place of the console's and the file's level
};

// Replaces the sinks' settings. Returns false, with a message on the console, if the file cannot be opened; the rest is in force then.
bool ConfigureLog( const VLogOptions& i_rOptions );

struct VLogObserver
{
  std::function<void( const VLogRecord& )> m_Function{};   // called on the logging thread
  int m_Level = LogLevel::Detail;
  std::string m_Category{};   // empty for all
};

// Adds an observer and returns its id, for RemoveLogObserver. A call that runs on another thread may end after the removal.
uint64_t AddLogObserver( VLogObserver i_Observer );
void RemoveLogObserver( uint64_t i_Id );

namespace Detail
{
// TCallSite is a type of its own for each call site, so each has a static of its own.
template<class TCallSite>
const VLogCategory& LogCategoryOf( const char* i_pName, TCallSite )
{
  static const VLogCategory& s_rCategory = LogCategory( i_pName );
  return s_rCategory;
}

template<class TCallSite>
const VLogCategory& LogCategoryOf( const VLogCategory& i_rCategory, TCallSite )
{
  return i_rCategory;
}

template<class TCallSite>
const VLogCategory& LogCategoryOf( const std::string& i_rName, TCallSite )
{
  return LogCategory( i_rName );
}

// Where a message comes from, and how important it is
struct VLogOrigin
{
  const char* m_pFile;
  int m_Line;
  int m_Level;
};

void WriteLog( const VLogCategory& i_rCategory, const VLogOrigin& i_rOrigin, std::string_view i_Format, const VLogArgument* i_pArguments,
  size_t i_Count );

template<class... TArgs>
void FormatAndWriteLog( const VLogCategory& i_rCategory, const VLogOrigin& i_rOrigin, std::string_view i_Format, const TArgs&... i_rArgs )
{
  const std::array<VLogArgument, sizeof...( TArgs )> Arguments{ VLogArgument( i_rArgs )... };
  WriteLog( i_rCategory, i_rOrigin, i_Format, Arguments.data(), Arguments.size() );
}
}
}

// Category: a text literal (looked up once per call site), a `const VLogCategory&` kept by the caller, or a std::string (looked up
// at every call). Level: 2 error, 3 warning, 5 and 6 information. Then the format and its arguments; see FormatLogMessage.
#define KVZ_LOG( Category, Level, ... )                                                                \
  do {                                                                                                 \
    const ::KVZ::VLogCategory& rKvzLogCategory = ::KVZ::Detail::LogCategoryOf( Category, [] {} );      \
    if( rKvzLogCategory.IsAllowed( Level ) )                                                           \
    {                                                                                                  \
      ::KVZ::Detail::FormatAndWriteLog( rKvzLogCategory, { __FILE__, __LINE__, Level }, __VA_ARGS__ ); \
    }                                                                                                  \
  } while( false )

#define KVZ_LOG_ERROR( Category, ... ) KVZ_LOG( Category, ::KVZ::LogLevel::Error, __VA_ARGS__ )
#define KVZ_LOG_WARNING( Category, ... ) KVZ_LOG( Category, ::KVZ::LogLevel::Warning, __VA_ARGS__ )
#define KVZ_LOG_INFORMATION( Category, ... ) KVZ_LOG( Category, ::KVZ::LogLevel::Information, __VA_ARGS__ )
#define KVZ_LOG_DETAIL( Category, ... ) KVZ_LOG( Category, ::KVZ::LogLevel::Detail, __VA_ARGS__ )
