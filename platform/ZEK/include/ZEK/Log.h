#pragma once

#include <ZEK/Export.h>

#include <boost/format.hpp>

#include <atomic>
#include <chrono>
#include <cstddef>
#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

namespace ZEK
{

/// Levels of the log. Others may be used; a smaller number is graver.
enum ELogLevel : int
{
  ELogFailure = 2,
  ELogWarning = 3,
  ELogDetail = 6
};

struct VLogLine
{
  std::chrono::system_clock::time_point When;
  std::string Category;
  int Level = 0;
  std::string Text;
};

/// Takes finished lines. Thread: called on any thread, one line at a time, under the log's mutex: a sink must
/// not log itself.
class ILogSink
{
public:
  virtual ~ILogSink() = default;
  virtual void Take( const VLogLine& i_rLine ) = 0;
};

/// One named stream of the log, found once and kept in a static by its user.
class VLogCategory
{
public:
  explicit VLogCategory( std::string i_Name )
    : m_Name( std::move( i_Name ) )
  {
  }

  const std::string& Name() const { return m_Name; }
  /// True when lines of this level are taken: the question to ask before a text is built.
  bool IsOn( int i_Level ) const { return i_Level <= m_MaximumLevel.load( std::memory_order_relaxed ); }
  void SetMaximumLevel( int i_Level ) { m_MaximumLevel.store( i_Level, std::memory_order_relaxed ); }

private:
  std::string m_Name;
  std::atomic< int > m_MaximumLevel{ ELogWarning };
};

/// The process-wide categorised log. One instance serves host and plug-in.
class VLog
{
public:
  /// The category of that name, made on first use; the reference stays valid for the life of the process.
  ZEK_API VLogCategory& Category( std::string_view i_Name );
  /// Sets the greatest level that is taken, for all categories that exist and for those to come.
  ZEK_API void SetMaximumLevel( int i_Level );

  ZEK_API void AddSink( std::shared_ptr< ILogSink > i_pSink );
  ZEK_API void RemoveSink( const std::shared_ptr< ILogSink >& i_rpSink );

  /// Hands a finished text to every sink, whether or not the level is on.
  ZEK_API void Write( const VLogCategory& i_rCategory, int i_Level, std::string i_Text );

private:
  std::mutex m_Guard;
  int m_MaximumLevel = ELogWarning;
  std::deque< VLogCategory > m_Categories;
  std::vector< std::shared_ptr< ILogSink > > m_Sinks;
};

ZEK_API VLog& GlobalLog();

/// Formats `i_pTemplate`, whose places are %1%, %2%, …, and writes it if the level is on. A template that cannot
/// be formatted with these arguments gives the line "Cannot Format Log Message "<template>"" instead.
template < typename... TArguments >
void Log( const VLogCategory& i_rCategory, int i_Level, const char* i_pTemplate, const TArguments&... i_rArguments )
{
  if ( !i_rCategory.IsOn( i_Level ) )
  {
    return;
  }
  std::string Text;
  try
  {
    boost::format Format( i_pTemplate );
    (void)( Format % ... % i_rArguments );
    Text = Format.str();
  }
  catch ( const boost::io::format_error& )
  {
    Text = std::string( "Cannot Format Log Message \"" ) + i_pTemplate + "\"";
  }
  GlobalLog().Write( i_rCategory, i_Level, std::move( Text ) );
}

/// Writes lines to stderr as «time category level: text».
class ZEK_API VLogStderr final : public ILogSink
{
public:
  void Take( const VLogLine& i_rLine ) override;
};

/// Keeps the newest lines for the log panel, the report and tests. Thread: any.
class ZEK_API VLogRing final : public ILogSink
{
public:
  explicit VLogRing( std::size_t i_Capacity = 1000 )
    : m_Capacity( i_Capacity )
  {
  }

  void Take( const VLogLine& i_rLine ) override;
  /// The kept lines, oldest first.
  std::vector< VLogLine > Lines() const;
  /// The number of lines ever taken; tells a reader whether `Lines` has changed.
  std::size_t Count() const;
  void Clear();

private:
  mutable std::mutex m_Guard;
  std::size_t m_Capacity;
  std::size_t m_Count = 0;
  std::deque< VLogLine > m_Lines;
};

} // namespace ZEK
