#include "Editor/Tools/Quillet/quillet_PEImage.h"

#include <string.h>

namespace
{
    constexpr uint64_t kSectionTableOffset = kPEOptionalHeaderOffset;  // plus sizeOfOptionalHeader
    constexpr uint64_t kMiscOffset = offsetof(PE_IMAGE_SECTION_HEADER, Misc);

    // Copies `length` bytes from file offset `from` to image offset `to`.
    const char* CopyBlock(const ByteView& file, uint64_t from, const MutableByteView& image, uint64_t to,
                          uint64_t length, const char* outsideFile, const char* outsideImage)
    {
        const uint8_t* src = file.At(from, length);
        if (!src)
            return outsideFile;
        uint8_t* dst = image.At(to, length);
        if (!dst)
            return outsideImage;
        memcpy(dst, src, length);
        return nullptr;
    }

    const char* CopySection(const ByteView& file, const MutableByteView& image, uint64_t entry,
                            const PE_IMAGE_SECTION_HEADER& section, int32_t sectionAlignment, PEFilledRanges& filled)
    {
        const char* outside = "Failed to load DLL: section outside the image";
        uint8_t* dst = nullptr;
        if (section.SizeOfRawData == 0)
        {
            if (sectionAlignment <= 0)
                return nullptr;
            dst = image.At(section.VirtualAddress, static_cast<uint64_t>(sectionAlignment));
            if (!dst)
                return outside;
            // Zero-filled: only the parts that earlier copies wrote can hold anything else.
            filled.ForEachInside(section.VirtualAddress, static_cast<uint64_t>(sectionAlignment),
                                 [&](uint64_t offset, uint64_t length) { memset(image.Base() + offset, 0, length); });
        }
        else
        {
            if (const char* error = CopyBlock(file, section.PointerToRawData, image, section.VirtualAddress,
                                              section.SizeOfRawData, "Failed to load DLL: section data outside the file", outside))
                return error;
            dst = image.Base() + section.VirtualAddress;
            filled.Add(section.VirtualAddress, section.SizeOfRawData);
        }
        // The low half of the mapped address, as the field is only 32 bits wide.
        image.Write<uint32_t>(entry + kMiscOffset, static_cast<uint32_t>(reinterpret_cast<uint64_t>(dst)));
        return nullptr;
    }

    const char* RelocateBlock(const MutableByteView& image, uint64_t block, const PE_IMAGE_BASE_RELOCATION& header,
                              uint64_t locDelta, PEFilledRanges& filled)
    {
        if (!image.Contains(block, header.sizeOfBlock))
            return "Failed to load DLL: relocation block outside the image";
        if (!filled.Covers(block, header.sizeOfBlock))
            return "Failed to load DLL: relocation block outside the file's data";
        const uint64_t entries = (header.sizeOfBlock - sizeof(PE_IMAGE_BASE_RELOCATION)) / 2;
        for (uint64_t i = 0; i < entries; ++i)
        {
            uint16_t entry = 0;
            if (!image.Read(block + sizeof(PE_IMAGE_BASE_RELOCATION) + 2 * i, entry))
                return "Failed to load DLL: relocation block outside the image";
            const uint16_t type = entry >> 12;
            if (type != kPERelocationDir64 && type != kPERelocationHighLow)
                continue;
            // HIGHLOW targets are patched as 64-bit words too; only DIR64 occurs in x64 images.
            const uint64_t target = static_cast<uint64_t>(header.va) + (entry & 0xFFF);
            uint64_t value = 0;
            if (!image.Read(target, value))
                return "Failed to load DLL: relocation target outside the image";
            if (!filled.Covers(target, sizeof value))
                return "Failed to load DLL: relocation target outside the file's data";
            image.Write(target, value + locDelta);
        }
        return nullptr;
    }
}

const char* ReadFileHeaders(const ByteView& file, PEFileHeaders& out)
{
    PE_IMAGE_DOS_HEADER dos{};
    if (!file.Read(0, dos))
        return "Failed to load DLL: size smaller than PE header";
    if (dos.magic != kPEDosMagic)
        return "Failed to load DLL: not a windows DLL (DOS header field mismatch)";
    const char* outside = "Failed to load DLL: NT headers outside the file";
    if (dos.ntHeader < 0)
        return outside;
    out.ntOffset = static_cast<uint64_t>(dos.ntHeader);
    if (!file.Read(out.ntOffset, out.nt.Signature))
        return outside;
    if (out.nt.Signature != kPENtSignature)
        return "Failed to load DLL: not a windows DLL (NT header field mismatch)";
    if (!file.Read(out.ntOffset + kPEOptionalHeaderOffset, out.nt.OptionalHeader.Magic))
        return outside;
    if (out.nt.OptionalHeader.Magic != kPEOptionalMagic64)
        return "Failed to load DLL: not a 64 bit DLL";
    if (!file.Read(out.ntOffset, out.nt))
        return outside;
    return nullptr;
}

const char* CopyHeaders(const ByteView& file, const MutableByteView& image, const PEFileHeaders& headers,
                        PEFilledRanges& filled)
{
    // The DOS part comes along: the length is the NT offset plus SizeOfHeaders, summed in 32 bits.
    const uint32_t length = static_cast<uint32_t>(headers.ntOffset) + headers.nt.OptionalHeader.SizeOfHeaders;
    if (const char* error = CopyBlock(file, 0, image, 0, length, "Failed to load DLL: headers outside the file",
                                      "Failed to load DLL: headers outside the image"))
        return error;
    filled.Add(0, length);
    if (!image.Contains(headers.ntOffset, sizeof(PE_IMAGE_NT_HEADERS)))
        return "Failed to load DLL: headers outside the image";
    const uint64_t base = reinterpret_cast<uint64_t>(image.Base());
    image.Write(headers.ntOffset + kPEOptionalHeaderOffset + offsetof(PE_IMAGE_OPTIONAL_HEADER, ImageBase), base);
    return nullptr;
}

const char* CopySections(const ByteView& file, const MutableByteView& image, const PEFileHeaders& headers,
                         PEFilledRanges& filled)
{
    const int32_t sectionAlignment = static_cast<int32_t>(headers.nt.OptionalHeader.SectionAlignment);
    uint64_t rawBytes = 0;
    const uint64_t fileHeader = headers.ntOffset + offsetof(PE_IMAGE_NT_HEADERS, FileHeader);
    // The count and the table position are re-read from the mapped headers on every pass, as a
    // section may be placed over them.
    for (int32_t i = 0;; ++i)
    {
        PE_IMAGE_FILE_HEADER fh{};
        if (!image.Read(fileHeader, fh))
            return "Failed to load DLL: headers outside the image";
        if (i >= static_cast<int32_t>(fh.numberOfSections))
            return nullptr;
        const uint64_t entry = headers.ntOffset + kSectionTableOffset + fh.sizeOfOptionalHeader +
                               static_cast<uint64_t>(i) * sizeof(PE_IMAGE_SECTION_HEADER);
        PE_IMAGE_SECTION_HEADER section{};
        if (!image.Read(entry, section))
            return "Failed to load DLL: section table outside the image";
        rawBytes += section.SizeOfRawData;
        if (rawBytes > file.Size())
            return "Failed to load DLL: sections hold more raw data than the file";
        if (const char* error = CopySection(file, image, entry, section, sectionAlignment, filled))
            return error;
    }
}

const char* DoRelocation(const MutableByteView& image, uint64_t ntOffset, uint64_t locDelta, PEFilledRanges& filled)
{
    PE_IMAGE_DATA_DIRECTORY dir{};
    if (!image.Read(ntOffset + PEDataDirectoryOffset(kPEDirectoryBaseRelocations), dir))
        return "Failed to load DLL: headers outside the image";
    if (locDelta == 0 || dir.size == 0)
        return nullptr;
    // The directory's size only flags presence; the blocks end at the first one whose va is 0.
    for (uint64_t block = dir.va;;)
    {
        PE_IMAGE_BASE_RELOCATION header{};
        if (!image.Read(block, header))
            return "Failed to load DLL: relocation block outside the image";
        if (header.va == 0)
            return nullptr;
        if (header.sizeOfBlock < sizeof(PE_IMAGE_BASE_RELOCATION))
            return "Failed to load DLL: relocation block smaller than its header";
        if (const char* error = RelocateBlock(image, block, header, locDelta, filled))
            return error;
        block += header.sizeOfBlock;
    }
}

const char* CheckExports(const MutableByteView& image, uint64_t ntOffset, PEFilledRanges& filled)
{
    PE_IMAGE_DATA_DIRECTORY dir{};
    if (!image.Read(ntOffset + PEDataDirectoryOffset(kPEDirectoryExports), dir))
        return "Failed to load DLL: headers outside the image";
    if (dir.size == 0)
        return nullptr;
    const char* outside = "Failed to load DLL: export table outside the image";
    PE_IMAGE_EXPORT_DIRECTORY exports{};
    if (!image.Read(dir.va, exports))
        return outside;
    const bool inside = image.Contains(exports.AddressOfNames, 4ull * exports.NumberOfNames) &&
                        image.Contains(exports.AddressOfNameOrdinals, 2ull * exports.NumberOfNames) &&
                        image.Contains(exports.AddressOfFunctions, 4ull * exports.NumberOfFunctions);
    if (!inside)
        return outside;
    const bool fromFile = filled.Covers(exports.AddressOfNames, 4ull * exports.NumberOfNames) &&
                          filled.Covers(exports.AddressOfNameOrdinals, 2ull * exports.NumberOfNames) &&
                          filled.Covers(exports.AddressOfFunctions, 4ull * exports.NumberOfFunctions);
    return fromFile ? nullptr : "Failed to load DLL: export table outside the file's data";
}
