#pragma once

#include <HarrowPluginInterface/IHarrowApplication.h>

#include <set>

namespace HostServices
{

/// The content folders. Each kind has its folder below the content root and, where the user's own root is another
/// one, the same below that, after it. Folders are made when they are asked for; one that cannot be made is logged
/// once at level 3 and listed all the same. Thread: GUI.
class VPaths final : public HarrowPluginInterface::IHarrowPaths
{
public:
  /// Empty roots stand for the application's data folder.
  explicit VPaths( std::filesystem::path i_ContentRoot = {}, std::filesystem::path i_UserRoot = {} );

  std::vector< std::wstring >& FoldersOfKind( std::vector< std::wstring >& o_rFolders,
                                              std::uint32_t i_KindMask ) const override;
  std::wstring BaseFolder() const override;

  const std::filesystem::path& ContentRoot() const { return m_ContentRoot; }
  const std::filesystem::path& UserRoot() const { return m_UserRoot; }

private:
  void MakeFolder( const std::filesystem::path& i_rFolder ) const;

  std::filesystem::path m_ContentRoot;
  std::filesystem::path m_UserRoot;
  mutable std::set< std::filesystem::path > m_Reported;
};

} // namespace HostServices
