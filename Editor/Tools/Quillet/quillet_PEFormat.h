#pragma once
// The PE/COFF records the loader reads, laid out byte for byte as in the file and in the mapped
// image (little-endian). Only the PE32+ (64-bit) optional header is described: the 32-bit form
// is recognised by its Magic alone and refused.

#include <stddef.h>
#include <stdint.h>

constexpr uint16_t kPEDosMagic = 0x5A4D;        // "MZ"
constexpr uint32_t kPENtSignature = 0x00004550; // "PE\0\0"
constexpr uint16_t kPEOptionalMagic64 = 0x020B; // PE32+

enum PEDataDirectoryIndex : uint32_t
{
    kPEDirectoryExports = 0,
    kPEDirectoryImports = 1,
    kPEDirectoryBaseRelocations = 5,
};

enum PERelocationType : uint16_t
{
    kPERelocationHighLow = 3,
    kPERelocationDir64 = 10,
};

struct PE_IMAGE_DOS_HEADER
{
    uint16_t magic;
    uint16_t lastPageBytes, pageCount, relocations, headerParaSize, minAlloc, maxAlloc;
    uint16_t initialSS, initialSP, checksum, initialIP, initialCS, relocAddr, overlay;
    uint16_t reserved[4];
    uint16_t oemID;
    uint16_t oemInfo;
    uint16_t reserved2[10];
    int32_t ntHeader;  // file offset of PE_IMAGE_NT_HEADERS
};

struct PE_IMAGE_FILE_HEADER
{
    uint16_t machine;
    uint16_t numberOfSections;
    uint32_t timeDateStamp;
    uint32_t pointerToSymbolTable;
    uint32_t numberOfSymbols;
    uint16_t sizeOfOptionalHeader;
    uint16_t characteristics;
};

struct PE_IMAGE_DATA_DIRECTORY
{
    uint32_t va;
    uint32_t size;
};

struct PE_IMAGE_OPTIONAL_HEADER
{
    uint16_t Magic;
    uint8_t MajorLinkerVersion, MinorLinkerVersion;
    uint32_t SizeOfCode, SizeOfInitializedData, SizeOfUninitializedData;
    uint32_t AddressOfEntryPoint;
    uint32_t BaseOfCode;
    uint64_t ImageBase;
    uint32_t SectionAlignment;
    uint32_t FileAlignment;
    uint16_t MajorOperatingSystemVersion, MinorOperatingSystemVersion;
    uint16_t MajorImageVersion, MinorImageVersion;
    uint16_t MajorSubsystemVersion, MinorSubsystemVersion;
    uint32_t Win32VersionValue;
    uint32_t SizeOfImage;
    uint32_t SizeOfHeaders;
    uint32_t CheckSum;
    uint16_t Subsystem, DllCharacteristics;
    uint64_t SizeOfStackReserve, SizeOfStackCommit, SizeOfHeapReserve, SizeOfHeapCommit;
    uint32_t LoaderFlags;
    uint32_t NumberOfRvaAndSizes;
    PE_IMAGE_DATA_DIRECTORY DataDirectory[16];
};

struct PE_IMAGE_NT_HEADERS
{
    uint32_t Signature;
    PE_IMAGE_FILE_HEADER FileHeader;
    PE_IMAGE_OPTIONAL_HEADER OptionalHeader;
};

struct PE_IMAGE_SECTION_HEADER
{
    uint8_t Name[8];
    union
    {
        uint32_t PhysicalAddress;
        uint32_t VirtualSize;
    } Misc;
    uint32_t VirtualAddress;
    uint32_t SizeOfRawData;
    uint32_t PointerToRawData;
    uint32_t PointerToRelocations;
    uint32_t PointerToLinenumbers;
    uint16_t NumberOfRelocations;
    uint16_t NumberOfLinenumbers;
    uint32_t Characteristics;
};

// Followed by (sizeOfBlock - 8) / 2 u16 entries: type in the top 4 bits, page offset below.
struct PE_IMAGE_BASE_RELOCATION
{
    uint32_t va;
    uint32_t sizeOfBlock;
};

struct PE_IMAGE_IMPORT_DESCRIPTOR
{
    union
    {
        uint32_t Characteristics;
        uint32_t OriginalFirstThunk;
    };
    uint32_t TimeDateStamp;
    uint32_t ForwarderChain;
    uint32_t Name;
    uint32_t FirstThunk;
};

// Hint, then the zero-terminated name.
struct PE_IMAGE_IMPORT_BY_NAME
{
    uint16_t Hint;
    char Name[1];
};

struct PE_IMAGE_EXPORT_DIRECTORY
{
    uint32_t Characteristics;
    uint32_t TimeDateStamp;
    uint16_t MajorVersion, MinorVersion;
    uint32_t Name;
    uint32_t Base;
    uint32_t NumberOfFunctions;
    uint32_t NumberOfNames;
    uint32_t AddressOfFunctions;
    uint32_t AddressOfNames;
    uint32_t AddressOfNameOrdinals;
};

static_assert(sizeof(PE_IMAGE_DOS_HEADER) == 64 && offsetof(PE_IMAGE_DOS_HEADER, ntHeader) == 60);
static_assert(sizeof(PE_IMAGE_FILE_HEADER) == 20);
static_assert(sizeof(PE_IMAGE_OPTIONAL_HEADER) == 240);
static_assert(offsetof(PE_IMAGE_OPTIONAL_HEADER, SizeOfImage) == 56);
static_assert(offsetof(PE_IMAGE_OPTIONAL_HEADER, NumberOfRvaAndSizes) == 108);
static_assert(offsetof(PE_IMAGE_OPTIONAL_HEADER, DataDirectory) == 112);
static_assert(sizeof(PE_IMAGE_NT_HEADERS) == 264 && offsetof(PE_IMAGE_NT_HEADERS, OptionalHeader) == 24);
static_assert(sizeof(PE_IMAGE_SECTION_HEADER) == 40 && offsetof(PE_IMAGE_SECTION_HEADER, Characteristics) == 36);
static_assert(sizeof(PE_IMAGE_IMPORT_DESCRIPTOR) == 20 && offsetof(PE_IMAGE_IMPORT_DESCRIPTOR, FirstThunk) == 16);
static_assert(sizeof(PE_IMAGE_EXPORT_DIRECTORY) == 40 && offsetof(PE_IMAGE_EXPORT_DIRECTORY, AddressOfNameOrdinals) == 36);

// Offsets of single fields, for reads through a byte view.
constexpr uint64_t kPEOptionalHeaderOffset = offsetof(PE_IMAGE_NT_HEADERS, OptionalHeader);
constexpr uint64_t PEDataDirectoryOffset(uint32_t index)
{
    return kPEOptionalHeaderOffset + offsetof(PE_IMAGE_OPTIONAL_HEADER, DataDirectory) + index * sizeof(PE_IMAGE_DATA_DIRECTORY);
}
