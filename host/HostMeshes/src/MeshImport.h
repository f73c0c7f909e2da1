#pragma once

#include <cstddef>
#include <filesystem>
#include <memory>
#include <span>
#include <string>

struct aiScene;
namespace Assimp
{
class Importer;
}

namespace HostMeshes
{

/// One file, as the importer library has it.
class VMeshImport
{
public:
  VMeshImport();
  ~VMeshImport();

  /// `i_rName` tells the format. What the file refers to is looked for in `i_rFolder` and nowhere above it; with an
  /// empty one nowhere. Null, with a reason in `o_rReason`, when it cannot be read. The result lives as long as this.
  const aiScene* Read( std::span< const std::byte > i_Bytes, const std::string& i_rName,
                       const std::filesystem::path& i_rFolder, std::string& o_rReason );

private:
  std::unique_ptr< Assimp::Importer > m_pImporter;
};

} // namespace HostMeshes
