#include "desk/model/TicketFile.h"

#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "desk/model/FileContent.h"
#include "desk/model/SavedFile.h"
#include "desk/model/TicketStream.h"

namespace desk
{
namespace
{
constexpr int OneTicket = 1;
constexpr int ManyTickets = 2;

LossKind KindOf(comgui::SnapshotDifference const& difference)
{
    if (!difference.before)
        return LossKind::Added;
    if (!difference.after)
        return LossKind::LeftOut;
    bool const isSameText = comgui::ToText(*difference.before) == comgui::ToText(*difference.after);
    return isSameText ? LossKind::TypeChanges : LossKind::ValueChanges;
}

FileResult<TicketOfFile> TicketInStream(std::string_view bytes, std::string const& file)
{
    FileResult<comgui::Snapshot> ticket = TicketOfStream(bytes, file);
    if (auto* const fault = std::get_if<FileFault>(&ticket))
        return std::move(*fault);
    return TicketOfFile{{}, std::get<comgui::Snapshot>(std::move(ticket))};
}
}  // namespace

FileResult<TicketOfFile> ImportTicket(std::string const& file)
{
    FileResult<std::string> bytes = LoadFile(file, LargestFile);
    if (auto* const fault = std::get_if<FileFault>(&bytes))
        return std::move(*fault);
    return TicketOfBytes(std::get<std::string>(bytes), file);
}

FileResult<TicketOfFile> TicketOfBytes(std::string_view bytes, std::string const& file)
{
    constexpr std::string_view ByteOrderMark = "\xEF\xBB\xBF";
    if (bytes.empty())
        return FileFault{FileTrouble::Empty, file, {}, {}, {}};
    if (bytes.size() > LargestFile)
        return FileFault{FileTrouble::TooLarge, file, {}, {}, {}};
    int const stream = MTICKET_BINSTREAM::Detect(bytes.data(), bytes.size());
    if (stream == OneTicket)
        return TicketInStream(bytes, file);
    if (stream == ManyTickets)
        return FileFault{FileTrouble::ContainerStream, file, {}, {}, {}};
    std::string_view const xml =
        bytes.starts_with(ByteOrderMark) ? bytes.substr(ByteOrderMark.size()) : bytes;
    auto const begin = xml.find_first_not_of(" \t\r\n");
    if (begin == xml.npos || xml[begin] != '<')
        return FileFault{FileTrouble::UnknownForm, file, {}, {}, {}};
    return TicketOfXml(xml, file);
}

FileResult<std::vector<FileLoss>> LossesOf(comgui::Snapshot const& ticket, std::string_view bytes)
{
    FileResult<TicketOfFile> read = TicketOfBytes(bytes, {});
    if (auto* const fault = std::get_if<FileFault>(&read))
        return std::move(*fault);
    std::vector<FileLoss> losses;
    for (auto const& difference : comgui::Difference(ticket, std::get<TicketOfFile>(read).ticket))
        losses.push_back({difference.key, KindOf(difference)});
    return losses;
}

FileResult<std::vector<FileLoss>> LossesOf(comgui::Snapshot const& before, comgui::Snapshot const& after,
                                           std::string_view bytes)
{
    auto const hasChanged = [&](FileLoss const& loss)
    {
        comgui::Value const* const was = before.Find(loss.key);
        comgui::Value const* const is = after.Find(loss.key);
        return was && is ? !(*was == *is) : was != is;
    };
    FileResult<std::vector<FileLoss>> losses = LossesOf(before, bytes);
    if (auto* const all = std::get_if<std::vector<FileLoss>>(&losses))
        std::erase_if(*all, hasChanged);
    return losses;
}
}  // namespace desk
