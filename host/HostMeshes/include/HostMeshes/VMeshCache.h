#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>
#include <HarrowPluginInterface/VMeshScene.h>

#include <chrono>

namespace HostMeshes
{

/// The meshes of the search folders, read on a thread of its own, and meshes that come with the program. The bone of
/// skeletons, "tetra_stripe.fbx", is there from the beginning; a file of that name replaces it.
///
/// A name is a file's, with its extension, below one of its category's folders; the first folder that has it wins. One
/// that is absolute or leaves the folder stands for nothing. A file that is not there or cannot be read is told of once
/// in the log and left alone until the folders of its category change. Each file is read once, whatever categories ask
/// for it. Thread: any. The destructor ends the reading of a file by
/// the reader, and waits for one that is read in this process.
class VMeshCache final : public HarrowPluginInterface::VMeshSceneCache
{
public:
  using VMeshRef = std::shared_ptr< const HarrowPluginInterface::VMeshScene >;

  /// `i_Reader` is the program that reads files, "harrow-mesh-reader". Without it they are read in this process, which
  /// a file made to do harm may end.
  explicit VMeshCache( std::filesystem::path i_Reader = {} );
  ~VMeshCache() override;
  VMeshCache( const VMeshCache& ) = delete;
  VMeshCache& operator=( const VMeshCache& ) = delete;

  /// Gives a mesh a name that no file can take from it, in every category. Null takes the name away again.
  void AddBuiltIn( const std::string& i_rName, VMeshRef i_pMesh );

  void SetSearchFolders( const std::string& i_rCategory, std::vector< std::filesystem::path > i_Folders ) override;
  ZEK::IMultiCallback< void() >& Changed() override;
  VMeshRef Request( const std::string& i_rCategory, const std::string& i_rName ) override;
  bool CanRead( const std::filesystem::path& i_rPath ) const override;

  /// How often a file was looked for or read so far.
  std::uint64_t ReadCount() const;
  /// Waits until all that was asked for is read or has failed, and `Changed` has fired. False when it takes longer.
  bool WaitUntilRead( std::chrono::milliseconds i_Longest ) const;

private:
  struct VState;
  std::unique_ptr< VState > m_pState;
};

} // namespace HostMeshes
