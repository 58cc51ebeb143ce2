#pragma once
// The settings store that stands in for the registry: two roots (the machine's and the
// user's), keys named by backslash paths, values of three types (DWORD, SZ, BINARY).
// Each root is one text file under the user's configuration folder
// ($XDG_CONFIG_HOME/torvellan-melodrift/, or $MELODRIFT_CONFIG_DIR when set), rewritten
// atomically on every change. A damaged file is reported, kept aside and replaced by an
// empty root, so the defaults are written again.

#include <cstdint>
#include <string>
#include <vector>

enum RegistryRoot {
    REG_ROOT_MACHINE = 0,   // HKEY_LOCAL_MACHINE: file "machine.reg"
    REG_ROOT_USER = 1       // HKEY_CURRENT_USER: file "user.reg"
};

enum RegistryAccess {
    REG_ACCESS_READ = 0,
    REG_ACCESS_WRITE = 1    // read and write
};

enum RegistryValueType { REG_TYPE_DWORD = 4, REG_TYPE_SZ = 1, REG_TYPE_BINARY = 3 };

// Result codes of the calls below (0 = success, as the system's registry calls report).
enum RegistryResult {
    REG_OK = 0,
    REG_NOT_FOUND = 2,        // key or value does not exist
    REG_ACCESS_DENIED = 5,    // the root's file or folder cannot be written
    REG_INVALID_HANDLE = 6,   // the key is not open (closed, or forgotten by resetRegistry)
    REG_WRONG_TYPE = 13,      // the value exists with another type
    REG_IO_ERROR = 29         // the root's file cannot be read or written
};

typedef int RegistryKey;      // 0 = no key

// Opens an existing key; *key = 0 and REG_NOT_FOUND when it does not exist.
int regOpenKey(int root, const std::string& path, int access, RegistryKey* key);
// Creates a key (and its parents) or opens it; *existed tells which. REG_ACCESS_DENIED
// when write access is asked and the root cannot be written.
int regCreateKey(int root, const std::string& path, int access, RegistryKey* key, bool* existed);
void regCloseKey(RegistryKey key);

int regQueryDword(RegistryKey key, const std::string& name, uint32_t* value);
int regQueryString(RegistryKey key, const std::string& name, std::string* value);
int regQueryBinary(RegistryKey key, const std::string& name, std::vector<uint8_t>* value);
// Setting a value on a key opened for reading only gives REG_ACCESS_DENIED.
int regSetDword(RegistryKey key, const std::string& name, uint32_t value);
int regSetString(RegistryKey key, const std::string& name, const std::string& value);
int regSetBinary(RegistryKey key, const std::string& name, const std::vector<uint8_t>& value);
int regDeleteValue(RegistryKey key, const std::string& name);

// The folder holding the two root files, as it is resolved now.
std::string registryFolder();
// Forgets what was read, so that the next call reads the files again (tests switch
// MELODRIFT_CONFIG_DIR between cases). Open keys become invalid.
void resetRegistry();
