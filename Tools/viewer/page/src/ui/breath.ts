// Lets everything else go on before long work does. Timers would wait longer the more often they are asked.

const channel = new MessageChannel();
const waiting: (() => void)[] = [];
channel.port1.onmessage = () => waiting.shift()?.();
// An open port would keep a program in Node from ending.
(channel.port1 as { unref?: () => void }).unref?.();

export function breath(): Promise<void> {
  return new Promise((done) => {
    waiting.push(done);
    channel.port2.postMessage(null);
  });
}
