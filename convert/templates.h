// Imposition template resolution: which installation directory holds the
// current templates.
#ifndef HF_CONVERT_TEMPLATES_H_
#define HF_CONVERT_TEMPLATES_H_

// True when the 32-bit view of the imposition product's registry key opens
// for reading under HKEY_LOCAL_MACHINE.
bool HasWow6432ProductKey();

#endif  // HF_CONVERT_TEMPLATES_H_
