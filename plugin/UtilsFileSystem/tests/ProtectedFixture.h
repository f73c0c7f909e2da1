#pragma once

#include "SaveFolder.h"

#include <TestSupport/LogGuard.h>
#include <UtilsFileSystem/FileIO.h>

#include <gtest/gtest.h>

#include <map>
#include <string>
#include <utility>
#include <vector>

namespace UtilsFileSystemTests
{

using Contents = std::map< std::string, std::string >;
using Lines = std::vector< std::pair< int, std::string > >;

/// In texts, * stands for the target's path.
inline std::string Expand( std::string i_Text, const std::string& i_rTarget )
{
  for ( std::size_t At = 0; ( At = i_Text.find( '*', At ) ) != std::string::npos; At += i_rTarget.size() )
  {
    i_Text.replace( At, 1, i_rTarget );
  }
  return i_Text;
}

class VProtected : public testing::Test
{
protected:
  ~VProtected() override { UtilsFileSystem::SetLockerLister( {} ); }

  Contents Left() const
  {
    Contents Found;
    for ( const std::string& rEnding : m_Folder.Endings() )
    {
      Found[rEnding] = m_Folder.Get( rEnding ).value_or( "a folder" );
    }
    return Found;
  }
  void Prepare( const Contents& i_rFiles )
  {
    m_Folder.Clear();
    for ( const auto& [Ending, Content] : i_rFiles )
    {
      m_Folder.Put( Ending, Content );
    }
    m_First = TestSupport::LogLines().size();
  }
  /// Compares what was logged since the last time to the letter, and announces the failures among it.
  void ExpectLines( const Lines& i_rExpected )
  {
    Lines Found;
    const std::vector< ZEK::VLogLine > All = TestSupport::LogLines();
    for ( ; m_First < All.size(); ++m_First )
    {
      EXPECT_EQ( All[m_First].Category, "UtilsFileSystem" );
      Found.emplace_back( All[m_First].Level, All[m_First].Text );
    }
    Lines Expected;
    for ( const auto& [Level, Text] : i_rExpected )
    {
      Expected.emplace_back( Level, Expand( Text, m_Folder.Target() ) );
      TestSupport::ExpectFailureLine( Expected.back().second );
    }
    EXPECT_EQ( Found, Expected );
  }

  VSaveFolder m_Folder;
  std::size_t m_First = 0;
};

} // namespace UtilsFileSystemTests
