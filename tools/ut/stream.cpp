// ut stream dump: the chunk tree of a persisted stream, in compact or plain form.
#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <ut/platform/input_file.h>

#include "commands.h"
#include "stream_decoder.h"

namespace ut::tool {
namespace {

constexpr std::size_t kPreviewBytes = 16;

struct DumpArguments {
    std::string file;
    std::string table;
    bool json = false;
};

std::vector<std::uint8_t> ReadAll(const std::string& file) {
    platform::InputFilePtr in(platform::OpenInputFile(file.c_str()));
    if (!in)
        Fail(kExitUsage, "cannot open " + file);
    std::vector<std::uint8_t> bytes;
    std::uint8_t block[65536];
    while (std::size_t got = platform::ReadInputFile(in.get(), block, sizeof block))
        bytes.insert(bytes.end(), block, block + got);
    return bytes;
}

const char* HeaderName(HeaderForm form) {
    switch (form) {
    case HeaderForm::Definition:
        return "definition";
    case HeaderForm::Reference:
        return "reference";
    default:
        return "plain";
    }
}

class TextPrinter {
public:
    explicit TextPrinter(std::span<const std::uint8_t> bytes) : bytes_(bytes) {}

    void Data(std::size_t offset, std::size_t size, int depth) const {
        if (size)
            Line(offset, depth,
                 "data  " + std::to_string(size) + " bytes  " +
                     HexPreview(bytes_.subspan(offset, size), kPreviewBytes));
    }

    void Chunk(const DecodedChunk& chunk, int depth) const {
        std::string header =
            chunk.header == HeaderForm::Plain ? "plain header" : "row " + std::to_string(chunk.row);
        if (chunk.header == HeaderForm::Definition)
            header += ", defined here";
        Line(chunk.offset, depth,
             ChunkIdText(chunk.id) + "  v" + VersionText(chunk.version) + "  " + std::to_string(chunk.size) +
                 " bytes  (" + header + ")");
        for (const auto& [name, value] : chunk.values)
            Line(chunk.body, depth + 1, name + ": " + value);
        Data(chunk.body, chunk.dataSize, depth + 1);
        for (const DecodedChunk& child : chunk.children)
            Chunk(child, depth + 1);
    }

private:
    static void Line(std::size_t offset, int depth, const std::string& text) {
        std::printf("%8zu  %s%s\n", offset, std::string(static_cast<std::size_t>(depth) * 2, ' ').c_str(),
                    text.c_str());
    }

    std::span<const std::uint8_t> bytes_;
};

void PrintText(const DecodedStream& stream, std::span<const std::uint8_t> bytes) {
    std::printf("%s stream, %zu bytes\n", stream.compact ? "compact" : "plain", stream.size);
    TextPrinter printer(bytes);
    for (const DecodedChunk& chunk : stream.chunks)
        printer.Chunk(chunk, 0);
    if (!stream.compact)
        return;
    std::printf("header table: %zu rows%s\n", stream.table.size(),
                stream.tableOutOfLine ? " from the table stream" : "");
    for (std::size_t row = 0; row < stream.table.size(); ++row)
        std::printf("%8zu  %s  v%u\n", row, ChunkIdText(stream.table[row].id).c_str(),
                    stream.table[row].version);
}

nlohmann::ordered_json DataJson(std::span<const std::uint8_t> bytes, std::size_t offset, std::size_t size) {
    return {
        {"offset", offset}, {"bytes", size}, {"hex", HexPreview(bytes.subspan(offset, size), kPreviewBytes)}};
}

nlohmann::ordered_json ChunkJson(const DecodedChunk& chunk, std::span<const std::uint8_t> bytes) {
    nlohmann::ordered_json out = {{"offset", chunk.offset},
                                  {"id", ChunkIdText(chunk.id)},
                                  {"version", chunk.version},
                                  {"size", chunk.size},
                                  {"header", HeaderName(chunk.header)}};
    if (chunk.row >= 0)
        out["row"] = chunk.row;
    if (!chunk.values.empty()) {
        out["values"] = nlohmann::ordered_json::object();
        for (const auto& [name, value] : chunk.values)
            out["values"][name] = value;
    }
    if (chunk.dataSize)
        out["data"] = DataJson(bytes, chunk.body, chunk.dataSize);
    if (!chunk.children.empty()) {
        out["children"] = nlohmann::ordered_json::array();
        for (const DecodedChunk& child : chunk.children)
            out["children"].push_back(ChunkJson(child, bytes));
    }
    return out;
}

void PrintJson(const DecodedStream& stream, std::span<const std::uint8_t> bytes) {
    nlohmann::ordered_json out = {{"form", stream.compact ? "compact" : "plain"}, {"bytes", stream.size}};
    out["chunks"] = nlohmann::ordered_json::array();
    for (const DecodedChunk& chunk : stream.chunks)
        out["chunks"].push_back(ChunkJson(chunk, bytes));
    if (stream.compact) {
        out["table"] = nlohmann::ordered_json::array();
        for (const HeaderRow& row : stream.table)
            out["table"].push_back({{"id", ChunkIdText(row.id)}, {"version", row.version}});
    }
    std::printf("%s\n", out.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace).c_str());
}

void Dump(const DumpArguments& arguments) {
    std::vector<std::uint8_t> bytes = ReadAll(arguments.file);
    std::vector<std::uint8_t> table =
        arguments.table.empty() ? std::vector<std::uint8_t>{} : ReadAll(arguments.table);
    DecodedStream stream;
    std::string error;
    if (!DecodeStream(bytes, table, stream, error))
        Fail(kExitNo, arguments.file + ": not a chunk stream: " + error);
    if (arguments.json)
        PrintJson(stream, bytes);
    else
        PrintText(stream, bytes);
}

} // namespace

void AddStreamCommand(CLI::App& app) {
    CLI::App* stream = app.add_subcommand("stream", "Look into persisted streams.");
    stream->require_subcommand(1);
    auto arguments = std::make_shared<DumpArguments>();
    CLI::App* dump = stream->add_subcommand(
        "dump",
        "Print the chunk tree of a persisted stream, compact or plain: ids, versions, sizes, offsets, "
        "the header table, and the values of the chunks whose layout is known.");
    dump->add_option("FILE", arguments->file, "the stream's bytes")->required();
    dump->add_option("--table", arguments->table,
                     "the table stream of a stream written with its header table apart");
    dump->add_flag("--json", arguments->json, "print one JSON object instead of the tree");
    dump->footer(
        "A chunk's values come first and its nested chunks after them; bytes that are not chunks show as "
        "data. Exit status 1 when the file is not a chunk stream.\nExample:\n  ut stream dump scene.bin\n"
        "  compact stream, 171 bytes\n         0  IGAM  v256  0 bytes  (plain header)\n"
        "        12    form: compact\n        12  AEFS  v1  6 bytes  (row 0, defined here)\n"
        "        25    feature 0: version 1531\n        31  OBJ   v3  43 bytes  (row 1, defined here)\n"
        "        44    data  15 bytes  04 00 00 00 6F 00 62 00 6A 00 30 00 E8 3E FF");
    dump->callback([arguments] { Dump(*arguments); });
}

} // namespace ut::tool
