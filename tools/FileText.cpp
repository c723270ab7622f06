#include "tools/FileText.h"

#include "tessel/ReaderWriter.h"

namespace tools {

bool AppendFileText(ReaderWriter* file, std::string& text)
{
    if (file == nullptr || !(file->openRead() == RwOk)) {
        return false;
    }
    std::int32_t size = file->size();
    if (size <= 0) {
        file->close();
        return false;
    }
    std::string content(static_cast<std::size_t>(size), '\0');
    std::int32_t length = file->read(content.data(), size);
    file->close();
    if (length <= 0) {
        return false;
    }
    text.append(content.data(), static_cast<std::size_t>(length));
    return true;
}

} // namespace tools
