// Runs the Khronos glTF validator on one .gltf or .glb file (external resources are read beside
// it) and prints one line per error-level issue, then "errors N warnings M". Exit status: 0 when
// there are no errors, 1 when there are, 2 when the file could not be validated at all.
// The validator comes from scripts/install-validator.sh; NODE_PATH points at its node_modules.
const fs = require('fs');
const path = require('path');
const validator = require('gltf-validator');

const file = process.argv[2];
const bytes = new Uint8Array(fs.readFileSync(file));
validator.validateBytes(bytes, {
    uri: path.basename(file),
    maxIssues: 1000,
    externalResourceFunction: (uri) => new Promise((resolve, reject) => {
        fs.readFile(path.resolve(path.dirname(file), decodeURIComponent(uri)),
                    (err, data) => (err ? reject(err.toString()) : resolve(new Uint8Array(data))));
    }),
}).then((report) => {
    for (const issue of report.issues.messages)
        if (issue.severity === 0)
            console.log(`${issue.code} ${issue.pointer || ''}: ${issue.message}`);
    console.log(`errors ${report.issues.numErrors} warnings ${report.issues.numWarnings}`);
    process.exit(report.issues.numErrors === 0 ? 0 : 1);
}, (failure) => {
    console.log(`cannot validate: ${failure}`);
    process.exit(2);
});
